// Selection of the beam: the states with the largest values of a row.
#ifndef CLIPWEAVER_JNI_APM_BEAM_SELECTOR_H_
#define CLIPWEAVER_JNI_APM_BEAM_SELECTOR_H_

#include <cstddef>
#include <cstdint>
#include <vector>

#include "jni/apm/generation_marks.h"

namespace apm {

struct BeamEntry {
  int32_t state;
  double value;
};

// Writes to beam[0..width) the indices of the width largest of
// values[0..count), smallest first, exactly as a binary min-heap fed in
// index order leaves them: once the heap is full a larger value replaces
// the root, and equal values come out in the order its push and pop give
// them. Needs count >= width and no NaN.
class BeamSelector {
 public:
  void Select(const double* values, int32_t count, int32_t width,
              int32_t* beam);
  // The same for a row that differs from the one of the last call only at
  // the states changed[0..changed_count).
  void Reselect(const double* values, int32_t count, const int32_t* changed,
                int32_t changed_count, int32_t width, int32_t* beam);
  // The heap itself. The others take a shortcut, with the same result,
  // when the width largest values are distinct and above all the others.
  void SelectByHeap(const double* values, int32_t count, int32_t width,
                    int32_t* beam);

 private:
  // A binary heap with the smallest value at the root. Push sifts up past
  // every larger parent; Pop moves the last entry to the root and sifts it
  // down past every child it is at least equal to.
  void Push(int32_t state, double value);
  BeamEntry Pop();
  // Selects from above_, which holds every state valued at or above its
  // last entry, largest first.
  void Finish(const double* values, int32_t count, int32_t width,
              int32_t* beam);

  // Ranks kept below the beam. Each frame rescores the on-beat state of
  // every lag and the orphans, and a rescored state that falls below the
  // floor leaves the ranking; the spares make up for those losses on most
  // frames (when they do not, a full Select follows) while keeping the
  // ranking short to merge.
  static constexpr size_t kSpareRanks = 32;

  std::vector<BeamEntry> heap_;
  std::vector<BeamEntry> above_;
  std::vector<BeamEntry> fresh_;
  // Rows change in few places from frame to frame, so the last row's
  // ranking tells which values can matter in the next: every state valued
  // at or above floor_, largest first.
  std::vector<BeamEntry> ranked_;
  double floor_ = 0.0;
  bool has_floor_ = false;
  // The states the current Reselect was told changed.
  GenerationMarks changed_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_BEAM_SELECTOR_H_
