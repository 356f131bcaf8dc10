// Tempo and beat tracker. The music is modelled as a hidden sequence of
// (period, phase) states: a period ("lag") is a beat interval in frames, the
// phase says at which frames modulo the period the beats fall. Comb filters
// measure how strongly the detection function repeats at every period, a
// beam-limited Viterbi pass scores state sequences frame by frame, and the
// best path is backtracked. Beats go where the best state is on its beat or
// changes; the tempo is 60 over the median beat interval.
#ifndef CLIPWEAVER_JNI_APM_APM_H_
#define CLIPWEAVER_JNI_APM_APM_H_

#include <cstdint>
#include <functional>
#include <vector>

#include "jni/apm/apm_transition.h"
#include "jni/apm/beam_history.h"
#include "jni/apm/beam_selector.h"
#include "jni/apm/comb_bank.h"

namespace apm {

struct ApmConfig {
  int32_t beam_width = 100;
  int32_t phase_table_size = 100;
  int32_t period_table_size = 100;
  // At 1.0 or more the comb filters have no feedback.
  double comb_input_weight = 0.8;
  double tempo_prior_center_ms = 500.0;
  // Standard deviation in decades of the period.
  double tempo_prior_width = 0.2;
  double tempo_prior_weight = 2.0;
  bool use_tempo_prior = true;
  double min_period_ms = 50.0;
  double max_period_ms = 800.0;
  double transition_sigma_ms = 5.0;
  double period_change_weight = 0.5;
  double phase_deviation_weight = 0.9;
  int32_t max_apmtime_count = 2000;
  int32_t value_slot_count = 3;
  double detection_exponent = 0.5;
  double trim_threshold = 0.05;
  // Stands in for the detection value and comb output one period before
  // the start.
  double comb_start_factor = 0.1;
  // Least distance between two beats, as a fraction of the current period.
  double min_beat_spacing = 0.75;
  double beat_bonus = 2.0;
  // Scores every candidate from every beam entry, selects the beam through
  // the heap alone and keeps every beam row: the reference that the fast
  // paths match bit for bit.
  bool plain_search = false;
};

// Signed distance in frames from frame t to the nearest beat of a state with
// the given lag and phase, positive after the beat.
int32_t WrappedOffset(int32_t t, int32_t lag, int32_t phase);

// The same, given t mod lag.
inline int32_t WrappedPhaseOffset(int32_t position, int32_t lag,
                                  int32_t phase) {
  const int32_t half = lag / 2;
  int32_t x = position - phase;
  x += x <= -half ? lag : 0;
  x -= x > half ? lag : 0;
  return x;
}

// Frames of a best-state path (path[t] indexes state_lag and state_phase)
// that get a beat: where the state is on its beat or differs from the
// frame before, and more than min_beat_spacing periods after the last beat.
std::vector<int32_t> PlaceBeatFrames(const std::vector<int32_t>& path,
                                     const std::vector<int32_t>& state_lag,
                                     const std::vector<int32_t>& state_phase,
                                     double min_beat_spacing);

// Seconds from the start of the untrimmed detection function.
std::vector<double> BeatFramesToSeconds(const std::vector<int32_t>& frames,
                                        int32_t leading_trimmed,
                                        int32_t frames_per_second);

// 60 over the median beat interval (the upper middle one for an even
// count); 0 when there are fewer than two beats.
double MedianTempo(const std::vector<double>& beat_times);

class Apm {
 public:
  // Trims and shapes the detection function and builds the model. A
  // function with nothing to normalise or a set-up the tracker cannot run
  // is logged; Run then finds no beats.
  Apm(const ApmConfig& config, const std::vector<float>& detection_function,
      int32_t frames_per_second);
  Apm(const Apm&) = delete;
  Apm& operator=(const Apm&) = delete;

  // progress gets the fraction of frames done before frames 0, 500, 1000,
  // ...; true cancels, leaving no beats.
  void Run(std::function<bool(float)> progress);

  std::vector<double> beat_times() const { return beat_times_; }
  double bpm() const { return bpm_; }

 private:
  // Row-major 2-D array.
  template <typename T>
  struct Table {
    void Reset(int32_t row_count, int32_t column_count, T fill) {
      columns = column_count;
      cells.assign(static_cast<size_t>(row_count) * column_count, fill);
    }
    T* row(int32_t r) {
      return cells.data() + static_cast<size_t>(r) * columns;
    }
    const T* row(int32_t r) const {
      return cells.data() + static_cast<size_t>(r) * columns;
    }
    int32_t columns = 0;
    std::vector<T> cells;
  };

  bool TrimInput(const std::vector<float>& input, int32_t frames_per_second);
  bool SetUpStates();
  void SetUpSearch();
  void PrepareStep(int32_t t, int32_t cur, int32_t next, int32_t active);
  void CatchUpRow(int32_t t, const double* values, double* next_values);
  void Transition(int32_t cur, int32_t next, int32_t active);
  void TransitionOneByOne(int32_t cur, int32_t next, int32_t active);
  int32_t Offset(int32_t state) const;
  void Relink(int32_t state);
  void SelectBeam(int32_t next);
  void Backtrack();
  int32_t BestFinalState() const;
  void PlaceBeats();

  int32_t leading_trimmed_ = 0;
  int32_t trailing_trimmed_ = 0;
  int32_t lag_count_ = 0;
  int32_t time_count_ = 0;
  int32_t state_count_ = 0;
  int32_t value_count_ = 0;
  // Rows of the ring kept: 2, or value_count_ if that is less.
  int32_t row_count_ = 0;
  int32_t apmtime_count_ = 0;
  int32_t min_lag_ = 0;
  int32_t max_lag_ = 0;
  // The on-beat state of every lag, by lag index, then the orphans.
  std::vector<int32_t> candidates_;
  int32_t frames_per_second_ = 0;
  std::vector<float> detection_;

  CombBank comb_;
  // This frame's comb outputs, by lag index.
  const double* comb_out_ = nullptr;
  // Ring of row_count_ rows.
  Table<double> values_;
  std::vector<int32_t> predecessor_;
  std::vector<double> observation_;
  BeamHistory history_;
  std::vector<int32_t> beam_;

  std::vector<int32_t> lag_first_state_;
  std::vector<int32_t> lag_frames_;
  std::vector<double> lag_ms_;
  std::vector<int32_t> state_phase_;
  std::vector<int32_t> state_lag_;
  std::vector<double> tempo_prior_;
  std::vector<double> phase_deviation_score_;
  std::vector<double> period_change_score_;
  std::vector<double> beat_times_;
  double bpm_ = 0.0;
  ApmConfig config_;

  // False when the input or the set-up leaves nothing to track.
  bool ready_ = false;

  // Per-frame scratch, sized once.
  std::vector<int32_t> live_stamp_;
  std::vector<int32_t> candidate_lag_;
  std::vector<int32_t> candidate_offset_;
  std::vector<double> candidate_observation_;
  std::vector<double> candidate_prior_;
  std::vector<double> entry_base_;
  std::vector<int32_t> entry_lag_;
  std::vector<int32_t> entry_offset_;
  std::vector<double> best_;
  std::vector<int32_t> best_from_;
  TransitionScorer transition_;
  BeamSelector selector_;
  // The candidates of the last row_count_ frames, by frame modulo
  // row_count_: the states where the rows of the ring differ.
  std::vector<std::vector<int32_t>> changed_;
  // The current frame modulo every lag.
  std::vector<int32_t> frame_phase_;
  // What the per-frame steps look up of a state, side by side.
  struct StateShape {
    int32_t lag_index;
    int32_t lag;
    int32_t half;
    int32_t phase;
  };
  std::vector<StateShape> shape_;
  // The states with a given predecessor, as lists linked through the
  // states: so the states orphaned by the beam are found without a scan.
  std::vector<int32_t> first_child_;
  std::vector<int32_t> next_sibling_;
  std::vector<int32_t> previous_sibling_;
  std::vector<int32_t> linked_parent_;
  std::vector<int32_t> parents_;
  std::vector<char> is_parent_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_APM_H_
