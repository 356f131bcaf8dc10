// The transition step of the tracker: the best predecessor in the beam of
// every state to re-score. Done naively, every beam entry is scored against
// every lag's on-beat state; almost all of those scores differ only in the
// entry's own value, so a few representatives per frame give the same
// maxima and the same winners.
#ifndef CLIPWEAVER_JNI_APM_APM_TRANSITION_H_
#define CLIPWEAVER_JNI_APM_APM_TRANSITION_H_

#include <cstdint>
#include <vector>

#include "jni/apm/generation_marks.h"

namespace apm {

// The beam of a frame, entry k in beam order: its base score (beat bonus
// plus its value), lag index and phase offset.
struct BeamEntries {
  const double* base;
  const int32_t* lag;
  const int32_t* offset;
  int32_t count;
};

class TransitionScorer {
 public:
  // Lags are given as indices 0 .. lag_count - 1 of a grid with a step of
  // one frame, and phase offsets differ by offset_range at most. The tables
  // are indexed by differences of lags and of phase offsets, the last
  // entry serving every larger difference.
  void SetUp(int32_t lag_count, int32_t offset_range,
             const std::vector<double>& period_change_score,
             const std::vector<double>& phase_deviation_score);

  // For every lag index j, best[j] becomes the largest
  //   base[k] + (((observation[j] + period term) + phase term) + prior[j]),
  // period term = period_change_score[min(|j - lag[k]|, size - 1)],
  // phase term = phase_deviation_score[min(|offset[k]|, size - 1)],
  // and from[j] the first k that reaches it: the on-beat state of every
  // lag. Returns false, writing nothing, when an input is not finite or
  // large enough for the sums to overflow; the caller then has to score
  // with ScoreState.
  bool ScoreOnBeat(const BeamEntries& entries, const double* observation,
                   const double* prior, double* best, int32_t* from);

  // One state of lag index lag and phase offset offset, entry by entry in
  // beam order: each score above *best replaces it, and its entry goes to
  // *from.
  void ScoreState(const BeamEntries& entries, int32_t lag, int32_t offset,
                  double observation, double prior, double* best,
                  int32_t* from) const;

 private:
  // Beam entries that can win for some lag, largest base first.
  struct Kept {
    double base;
    int32_t lag;
    int32_t phase_class;
    int32_t entry;
    bool crowded;
  };

  void Keep(const BeamEntries& entries, bool ascending, bool spaced);
  template <bool kMayCrowd, typename Index>
  void KeepInOrder(const BeamEntries& entries, Index index);
  void FindLeader();
  void Limit(double key, int32_t* first, int32_t* last) const;
  void ScoreNear(const double* observation, const double* prior, double* best,
                 int32_t* from) const;
  void ScoreFar(const double* observation, const double* prior, double* best,
                int32_t* from) const;

  int32_t lag_count_ = 0;
  std::vector<double> period_;
  std::vector<double> phase_;
  // The tables by signed difference, from -(lag_count - 1) and from
  // -offset_range.
  std::vector<double> period_by_difference_;
  std::vector<double> phase_by_difference_;
  int32_t offset_range_ = 0;
  // From these differences on, every table entry has the same bits.
  int32_t period_tail_ = 0;
  int32_t phase_tail_ = 0;
  double period_max_abs_ = 0.0;
  double phase_max_abs_ = 0.0;
  // The most a near lag's period term exceeds the tail's, and whether none
  // falls below it.
  double period_gain_ = 0.0;
  bool near_at_least_tail_ = false;
  bool usable_ = false;
  // Read once: ScoreState runs for every orphan.
  bool avx_ = false;

  // Per call: how close two bases must be to possibly tie, how much the
  // rounding of a score can change comparisons of keys, and the leader.
  double delta_ = 0.0;
  double margin_ = 0.0;
  double lead_ = 0.0;
  int32_t lead_lag_ = 0;

  // The entries by descending base, where they are not simply reversed.
  std::vector<int32_t> order_;
  std::vector<Kept> kept_;
  int32_t kept_count_ = 0;
  // KeepInOrder's scratch: which neighbours by base are within delta.
  std::vector<uint8_t> close_;
  // Positions in kept_ by phase class, largest base first within a class;
  // class q takes by_class_[class_start_[q] .. class_start_[q + 1]).
  std::vector<int32_t> by_class_;
  std::vector<int32_t> class_start_;
  std::vector<int32_t> fill_;
  // Stamps of the (lag, phase class) groups already met in this call.
  GenerationMarks seen_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_APM_TRANSITION_H_
