// The beam of every frame, with each entry's predecessor, for the backtrack
// of the best path.
//
// Only the undecided rows are kept. Once every way back from the newest row
// meets in one state, the path below that merge point is fixed whatever
// state wins at the end, so it is backtracked there and then and its rows
// are dropped. A way back that meets a broken link goes on as the backtrack
// would, so this is exact by construction, broken links included: they are
// remembered and reported by the final backtrack in their usual order.
//
// How deep merges lie, at 100 frames a second: on a 120 BPM pulse over
// noise the ways back meet 4.0 to 4.6 seconds behind the newest frame, so
// with a check every 512 frames about a thousand rows are kept whatever the
// length. On near-silence (the noise alone) they meet only every minute or
// two, 68 to 179 seconds back in ten minutes: those rows are kept until
// then, as there is nothing to decide the path by.
#ifndef CLIPWEAVER_JNI_APM_BEAM_HISTORY_H_
#define CLIPWEAVER_JNI_APM_BEAM_HISTORY_H_

#include <cstdint>
#include <vector>

#include "jni/apm/generation_marks.h"

namespace apm {

// States are kept in 16 bits; this value stands for "no predecessor", so a
// model may have at most this many states.
constexpr uint16_t kNoPredecessor = 0xFFFF;

class BeamHistory {
 public:
  // For frame_count frames of a beam of width entries; keep_every_row
  // turns the dropping of decided rows off.
  void Reset(int32_t width, int32_t frame_count, bool keep_every_row);

  // Records the beam after frame t - 1 as row t, for t = 1, 2, ... in turn:
  // the states beam[0..width) and predecessor[state] of each, -1 for none.
  void Append(const int32_t* beam, const int32_t* predecessor);

  // Rows 1..decided() are backtracked already.
  int32_t decided() const { return decided_; }

  // One backtrack step through row t > decided(): the path's state at
  // frame t - 1 becomes *state, which then moves to its predecessor (-1 for
  // none). When *state is not in the row (a broken link) the step goes on
  // from the row's last entry, the best of the beam, and returns false.
  bool Follow(int32_t t, int32_t* state);

  // Whether the step through a decided row t was a broken link.
  bool WasBroken(int32_t t) const;

  // The state of every frame, complete after the backtrack.
  const std::vector<int32_t>& path() const { return path_; }

 private:
  const uint16_t* states(int32_t t) const;
  const uint16_t* predecessors(int32_t t) const;
  // The state before a way back that enters row t in state s.
  int32_t StepBack(int32_t t, int32_t s) const;
  // Adds state to ways unless it was added since the way marks' last
  // generation began.
  void AddWay(int32_t state, std::vector<int32_t>* ways);
  void CheckForMerge();
  void Settle(int32_t merge_row, int32_t state);

  int32_t width_ = 0;
  bool keep_every_row_ = false;
  int32_t last_row_ = 0;
  int32_t decided_ = 0;
  int32_t last_check_ = 0;
  // Rows decided_ + 1 .. last_row_, width_ entries each.
  std::vector<uint16_t> states_;
  std::vector<uint16_t> predecessors_;
  std::vector<int32_t> path_;
  // Ascending.
  std::vector<int32_t> broken_;

  // Scratch of the merge check: the position of each state in the row last
  // stepped through (never cleared, so other states may keep positions in
  // older rows), and the states the ways back are in.
  std::vector<int32_t> position_;
  std::vector<int32_t> ways_;
  std::vector<int32_t> next_ways_;
  GenerationMarks way_mark_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_BEAM_HISTORY_H_
