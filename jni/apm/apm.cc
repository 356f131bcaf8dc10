#include "jni/apm/apm.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "base/logging.h"
#include "jni/apm/tempo_model.h"

namespace apm {
namespace {

// A state no path reached this frame: only stored and copied, never
// computed, so == recognises it; extended, it counts as 0.
constexpr double kUnreached = -100000.0;

// The pass takes frames modulo every lag, reads the grid step off the
// second and third lag, and needs beam_width states in 16 bits each.
bool UsableModel(const ApmConfig& config, double min_lag, double max_lag) {
  double states = 0.0;
  if (min_lag >= 1.0 && max_lag >= min_lag && max_lag <= kNoPredecessor) {
    states = (min_lag + max_lag) * (max_lag - min_lag + 1.0) / 2.0;
  }
  const bool usable =
      min_lag >= 1.0 && max_lag - min_lag >= 2.0 &&
      states <= kNoPredecessor && config.beam_width >= 1 &&
      states >= config.beam_width && config.phase_table_size >= 1 &&
      config.period_table_size >= 1 && config.value_slot_count >= 1 &&
      config.max_apmtime_count >= 1;
  if (!usable) {
    LOG(ERROR) << "Unusable tempo model (minlag " << min_lag << ", maxlag "
               << max_lag << ", " << states << " states, beam width "
               << config.beam_width << "): no beats to track.";
  }
  return usable;
}

}  // namespace

Apm::Apm(const ApmConfig& config, const std::vector<float>& detection_function,
         int32_t frames_per_second)
    : config_(config) {
  ready_ = TrimInput(detection_function, frames_per_second) && SetUpStates();
}

// Cuts the frames below the threshold at both ends, then scales the rest to
// a maximum of 1 and applies the exponent.
bool Apm::TrimInput(const std::vector<float>& input,
                    int32_t frames_per_second) {
  const int32_t n = static_cast<int32_t>(input.size());
  // Compared in double, so the float nearest the threshold may reach it.
  const auto reaches = [this](float v) {
    return static_cast<double>(v) >= config_.trim_threshold;
  };
  int32_t start = 0;
  while (start < n && !reaches(input[start])) ++start;
  int32_t end = n;
  while (end > 0 && !reaches(input[end - 1])) --end;
  if (start >= end) {
    LOG(ERROR) << "Unable to trim detection function.";
    start = 0;
    end = n;
  }
  leading_trimmed_ = start;
  trailing_trimmed_ = n - end;
  frames_per_second_ = frames_per_second;
  detection_.assign(input.begin() + start, input.begin() + end);

  LOG(INFO) << "Input trimmed " << leading_trimmed_ << " leading points and "
            << trailing_trimmed_ << " trailing points to size "
            << detection_.size() << " in msec "
            << static_cast<float>(detection_.size() * 1000) / frames_per_second;

  float largest = 0.0f;
  bool finite = true;
  for (float v : detection_) {
    finite = finite && std::isfinite(v);
    largest = std::max(largest, v);
  }
  if (!finite || !(largest > 0.0f)) {
    LOG(ERROR) << "Detection function has no positive finite maximum: "
                  "no beats to track.";
    return false;
  }
  const float scale = 1.0f / largest;
  const float exponent = static_cast<float>(config_.detection_exponent);
  for (float& v : detection_) v = std::pow(v * scale, exponent);
  return true;
}

int32_t WrappedOffset(int32_t t, int32_t lag, int32_t phase) {
  return WrappedPhaseOffset(t % lag, lag, phase);
}

double MedianTempo(const std::vector<double>& beat_times) {
  if (beat_times.size() < 2) return 0.0;
  std::vector<double> intervals(beat_times.size() - 1);
  for (size_t i = 0; i < intervals.size(); ++i) {
    intervals[i] = beat_times[i + 1] - beat_times[i];
  }
  const auto middle = intervals.begin() + (beat_times.size() - 1) / 2;
  std::nth_element(intervals.begin(), middle, intervals.end());
  return 60.0 / *middle;
}

bool Apm::SetUpStates() {
  const double rate = frames_per_second_;
  // Periods in whole frames, halves rounded away from zero.
  const double min_lag = std::round(config_.min_period_ms * (0.001 * rate));
  const double max_lag = std::round(config_.max_period_ms * (0.001 * rate));
  if (!UsableModel(config_, min_lag, max_lag)) return false;
  min_lag_ = static_cast<int32_t>(min_lag);
  max_lag_ = static_cast<int32_t>(max_lag);
  lag_count_ = max_lag_ + 1 - min_lag_;
  time_count_ = static_cast<int32_t>(detection_.size());
  value_count_ = std::min(time_count_ + 1, config_.value_slot_count);

  lag_frames_.resize(lag_count_);
  lag_ms_.resize(lag_count_);
  for (int32_t i = 0; i < lag_count_; ++i) {
    lag_frames_[i] = min_lag_ + i;
    lag_ms_[i] = lag_frames_[i] * 1000.0 / rate;
  }
  const double delta_pd_ms = lag_ms_[2] - lag_ms_[1];
  phase_deviation_score_ =
      TransitionScores(config_.phase_table_size, config_.phase_deviation_weight,
                       delta_pd_ms, config_.transition_sigma_ms);
  period_change_score_ =
      TransitionScores(config_.period_table_size, config_.period_change_weight,
                       delta_pd_ms, config_.transition_sigma_ms);
  tempo_prior_ =
      config_.use_tempo_prior
          ? TempoPrior(lag_frames_, rate, config_.tempo_prior_center_ms,
                       config_.tempo_prior_width, config_.tempo_prior_weight)
          : std::vector<double>(lag_count_, 0.0);

  lag_first_state_.resize(lag_count_);
  state_lag_.clear();
  state_phase_.clear();
  for (int32_t i = 0; i < lag_count_; ++i) {
    lag_first_state_[i] = static_cast<int32_t>(state_lag_.size());
    for (int32_t phase = 0; phase < lag_frames_[i]; ++phase) {
      state_lag_.push_back(lag_frames_[i]);
      state_phase_.push_back(phase);
    }
  }
  state_count_ = static_cast<int32_t>(state_lag_.size());
  apmtime_count_ = std::min(time_count_, config_.max_apmtime_count);

  for (int32_t i = 0; i < lag_count_; ++i) {
    LOG(INFO) << "Lag " << i << " msec:" << lag_ms_[i]
              << " bpm:" << 60000.0 / lag_ms_[i];
  }
  LOG(INFO) << "delta_pd_ms " << delta_pd_ms;
  LOG(INFO) << "minlag " << min_lag_;
  LOG(INFO) << "maxlag " << max_lag_;
  LOG(INFO) << "lag count " << lag_count_;
  LOG(INFO) << "time count " << time_count_;
  LOG(INFO) << "state count " << state_count_;
  LOG(INFO) << "value count " << value_count_;
  LOG(INFO) << "apmtime count " << apmtime_count_;
  SetUpSearch();
  return true;
}

// The search's tables and scratch, sized once for the model.
void Apm::SetUpSearch() {
  // A frame reads one row and writes the next: two hold every read.
  row_count_ = std::min(value_count_, 2);
  values_.Reset(row_count_, state_count_, kUnreached);
  observation_.assign(state_count_, kUnreached);
  comb_.Reset(lag_frames_,
              apmtime_count_ > max_lag_ ? max_lag_ + 1 : apmtime_count_,
              config_.comb_input_weight, config_.comb_start_factor);
  history_.Reset(config_.beam_width, time_count_, config_.plain_search);
  predecessor_.assign(state_count_, -1);
  // The first frame extends the phase-0 state of every lag.
  beam_.assign(std::max(config_.beam_width, lag_count_), 0);
  std::copy(lag_first_state_.begin(), lag_first_state_.end(), beam_.begin());

  // Scratch of the per-frame steps.
  live_stamp_.assign(state_count_, -1);
  candidates_.reserve(state_count_);
  candidate_lag_.assign(state_count_, 0);
  candidate_offset_.assign(state_count_, 0);
  candidate_observation_.assign(state_count_, 0.0);
  candidate_prior_.assign(state_count_, 0.0);
  entry_base_.assign(beam_.size(), 0.0);
  entry_lag_.assign(beam_.size(), 0);
  entry_offset_.assign(beam_.size(), 0);
  best_.assign(lag_count_, 0.0);
  best_from_.assign(lag_count_, 0);
  transition_.SetUp(lag_count_, max_lag_, period_change_score_,
                    phase_deviation_score_);
  frame_phase_.assign(lag_count_, 0);
  // Read together by the per-frame steps: one line of memory, not four.
  shape_.resize(state_count_);
  for (int32_t s = 0; s < state_count_; ++s) {
    const int32_t lag = state_lag_[s];
    shape_[s] = {lag - min_lag_, lag, lag / 2, state_phase_[s]};
  }
  changed_.assign(row_count_, {});
  first_child_.assign(state_count_, -1);
  next_sibling_.assign(state_count_, -1);
  previous_sibling_.assign(state_count_, -1);
  linked_parent_.assign(state_count_, -1);
  is_parent_.assign(state_count_, 0);
}

// Candidates: the on-beat state of every lag (lag index order), then the
// states whose best predecessor has left the beam.
void Apm::PrepareStep(int32_t t, int32_t cur, int32_t next, int32_t active) {
  candidates_.resize(lag_count_);
  for (int32_t i = 0; i < lag_count_; ++i) {
    if (t > 0 && ++frame_phase_[i] == lag_frames_[i]) frame_phase_[i] = 0;
    candidates_[i] = lag_first_state_[i] + frame_phase_[i];
    observation_[candidates_[i]] = comb_out_[i];
  }
  // The beam entries as the scoring takes them; on the way, the states
  // that lead on from this frame are stamped live for the orphan walk.
  const double* values = values_.row(cur);
  const double bonus = config_.beat_bonus;
  for (int32_t k = 0; k < active; ++k) {
    const int32_t f = beam_[k];
    const bool reached = values[f] != kUnreached;
    if (reached) live_stamp_[f] = t;
    entry_base_[k] = bonus + (reached ? values[f] : 0.0);
    entry_lag_[k] = shape_[f].lag_index;
    entry_offset_[k] = Offset(f);
  }
  size_t kept = 0;
  for (const int32_t parent : parents_) {
    if (first_child_[parent] == -1) {
      is_parent_[parent] = 0;
      continue;
    }
    parents_[kept++] = parent;
    if (live_stamp_[parent] == t) continue;
    for (int32_t s = first_child_[parent]; s != -1; s = next_sibling_[s]) {
      if (shape_[s].phase != frame_phase_[shape_[s].lag_index]) {
        candidates_.push_back(s);
      }
    }
  }
  parents_.resize(kept);

  // The candidates are scored afresh.
  double* next_values = values_.row(next);
  if (next != cur) CatchUpRow(t, values, next_values);
  changed_[t % row_count_] = candidates_;
  for (int32_t c : candidates_) next_values[c] = kUnreached;
}

// Row next is behind row cur by the candidates of the frames since it was
// last written; copying just those is usually far less than the whole row.
void Apm::CatchUpRow(int32_t t, const double* values, double* next_values) {
  const int32_t frames = std::min(row_count_ - 1, t);
  size_t behind = 0;
  for (int32_t back = 1; back <= frames; ++back) {
    behind += changed_[(t - back) % row_count_].size();
  }
  // A scattered copy costs several times a streamed one per state: from an
  // eighth of the row on, copying the whole row is the cheaper.
  if (config_.plain_search || behind * 8 >= static_cast<size_t>(state_count_)) {
    std::copy_n(values, state_count_, next_values);
    return;
  }
  for (int32_t back = 1; back <= frames; ++back) {
    for (int32_t s : changed_[(t - back) % row_count_]) {
      next_values[s] = values[s];
    }
  }
}

void Apm::Run(std::function<bool(float)> progress) {
  if (!ready_) return;
  int32_t active = lag_count_;
  for (int32_t t = 0; t < time_count_; ++t) {
    if (t % 500 == 0) {
      LOG(INFO) << "Timestep " << t << " "
                << static_cast<float>(t) / frames_per_second_ << " sec";
      if (progress && progress(static_cast<float>(t) / time_count_)) return;
    }
    const int32_t cur = t % row_count_;
    const int32_t next = (t + 1) % row_count_;
    comb_out_ = comb_.Filter(detection_, t);
    PrepareStep(t, cur, next, active);
    Transition(cur, next, active);
    SelectBeam(next);
    active = config_.beam_width;
  }
  Backtrack();
  PlaceBeats();
}

// The heap alone is the reference that the shortcuts match.
void Apm::SelectBeam(int32_t next) {
  if (config_.plain_search) {
    selector_.SelectByHeap(values_.row(next), state_count_, config_.beam_width,
                           beam_.data());
  } else {
    selector_.Reselect(values_.row(next), state_count_, candidates_.data(),
                       static_cast<int32_t>(candidates_.size()),
                       config_.beam_width, beam_.data());
  }
  history_.Append(beam_.data(), predecessor_.data());
}

// The state's wrapped phase offset at the current frame: frames since its
// nearest beat, negative before it.
int32_t Apm::Offset(int32_t state) const {
  const StateShape& shape = shape_[state];
  int32_t x = frame_phase_[shape.lag_index] - shape.phase;
  x += x <= -shape.half ? shape.lag : 0;
  x -= x > shape.half ? shape.lag : 0;
  return x;
}

// The best of all beam entries for every candidate; for the on-beat states
// through the grouped scoring when it applies. The orphan lists follow the
// new predecessors in candidate order.
void Apm::Transition(int32_t cur, int32_t next, int32_t active) {
  // With a single value row, entries read later see this frame's updates,
  // which only the pass in beam order reproduces.
  if (next == cur || config_.plain_search) {
    TransitionOneByOne(cur, next, active);
    for (int32_t c : candidates_) {
      if (predecessor_[c] != linked_parent_[c]) Relink(c);
    }
    return;
  }
  const BeamEntries entries{entry_base_.data(), entry_lag_.data(),
                            entry_offset_.data(), active};
  double* next_values = values_.row(next);
  size_t first = 0;
  if (transition_.ScoreOnBeat(entries, comb_out_, tempo_prior_.data(),
                              best_.data(), best_from_.data())) {
    for (int32_t j = 0; j < lag_count_; ++j) {
      const int32_t c = candidates_[j];
      if (best_[j] > next_values[c]) {
        next_values[c] = best_[j];
        predecessor_[c] = beam_[best_from_[j]];
        // Relinked at once, still in candidate order: the lists' order is
        // the order in which later frames find their orphans.
        if (predecessor_[c] != linked_parent_[c]) Relink(c);
      }
    }
    first = lag_count_;
  }
  // The others one at a time, as the pass over all candidates would.
  for (size_t i = first; i < candidates_.size(); ++i) {
    const int32_t c = candidates_[i];
    const int32_t lag = shape_[c].lag_index;
    int32_t from = -1;
    transition_.ScoreState(entries, lag, Offset(c), observation_[c],
                           tempo_prior_[lag], &next_values[c], &from);
    if (from != -1) {
      predecessor_[c] = beam_[from];
      if (predecessor_[c] != linked_parent_[c]) Relink(c);
    }
  }
}

// Moves a state to the list of its current predecessor.
inline void Apm::Relink(int32_t state) {
  const int32_t parent = predecessor_[state];
  const int32_t old = linked_parent_[state];
  const int32_t before = previous_sibling_[state];
  const int32_t after = next_sibling_[state];
  if (old != -1) {
    (before == -1 ? first_child_[old] : next_sibling_[before]) = after;
    if (after != -1) previous_sibling_[after] = before;
  }
  previous_sibling_[state] = -1;
  next_sibling_[state] = first_child_[parent];
  if (first_child_[parent] != -1) {
    previous_sibling_[first_child_[parent]] = state;
  }
  first_child_[parent] = state;
  linked_parent_[state] = parent;
  if (!is_parent_[parent]) {
    is_parent_[parent] = 1;
    parents_.push_back(parent);
  }
}

// Row t of the beam history holds the beam after frame t - 1, so it names
// the predecessor of the path's state at that frame. Rows up to the last
// merge point were followed when the merge was found.
void Apm::Backtrack() {
  int32_t s = BestFinalState();
  for (int32_t t = time_count_; t >= 1; --t) {
    const bool linked = t > history_.decided() ? history_.Follow(t, &s)
                                               : !history_.WasBroken(t);
    // A broken link goes on from the best state of the beam.
    if (!linked) {
      LOG(ERROR) << "Broken state link " << t << " of " << time_count_;
    }
  }
}

// The first state with the largest value after the last frame.
int32_t Apm::BestFinalState() const {
  // Below any value a row holds, kUnreached included.
  constexpr double kBelowEveryValue = -10000000.0;
  const double* last = values_.row(time_count_ % row_count_);
  int32_t state = 0;
  double best = kBelowEveryValue;
  for (int32_t s = 0; s < state_count_; ++s) {
    if (last[s] > best) {
      best = last[s];
      state = s;
    }
  }
  return state;
}

void Apm::PlaceBeats() {
  beat_times_ =
      BeatFramesToSeconds(PlaceBeatFrames(history_.path(), state_lag_,
                                          state_phase_,
                                          config_.min_beat_spacing),
                          leading_trimmed_, frames_per_second_);
  bpm_ = MedianTempo(beat_times_);
}

// Scores every candidate from every beam entry in turn. The per-candidate
// and per-entry terms are looked up once; the sum keeps its grouping.
void Apm::TransitionOneByOne(int32_t cur, int32_t next, int32_t active) {
  const int32_t count = static_cast<int32_t>(candidates_.size());
  for (int32_t j = 0; j < count; ++j) {
    const int32_t c = candidates_[j];
    candidate_lag_[j] = shape_[c].lag;
    candidate_offset_[j] = Offset(c);
    candidate_observation_[j] = observation_[c];
    candidate_prior_[j] = tempo_prior_[shape_[c].lag_index];
  }
  const int32_t last_period = config_.period_table_size - 1;
  const int32_t last_phase = config_.phase_table_size - 1;
  const double* values = values_.row(cur);
  double* next_values = values_.row(next);
  for (int32_t k = 0; k < active; ++k) {
    const int32_t f = beam_[k];
    const double base =
        config_.beat_bonus + (values[f] == kUnreached ? 0.0 : values[f]);
    const int32_t lag = shape_[f].lag;
    const int32_t offset = Offset(f);
    for (int32_t j = 0; j < count; ++j) {
      const double period = period_change_score_[std::min(
          std::abs(candidate_lag_[j] - lag), last_period)];
      const double phase = phase_deviation_score_[std::min(
          std::abs(offset - candidate_offset_[j]), last_phase)];
      const double score =
          base + (((candidate_observation_[j] + period) + phase) +
                  candidate_prior_[j]);
      const int32_t c = candidates_[j];
      if (score > next_values[c]) {
        next_values[c] = score;
        predecessor_[c] = f;
      }
    }
  }
}

std::vector<int32_t> PlaceBeatFrames(const std::vector<int32_t>& path,
                                     const std::vector<int32_t>& state_lag,
                                     const std::vector<int32_t>& state_phase,
                                     double min_beat_spacing) {
  // Far enough back that the first candidate is always spaced from it.
  constexpr int32_t kNoBeatYet = -1000000;
  std::vector<int32_t> frames;
  int32_t last = kNoBeatYet;
  int32_t previous_lag = -1;
  int32_t previous_phase = -1;
  for (int32_t t = 0; t < static_cast<int32_t>(path.size()); ++t) {
    const int32_t lag = state_lag[path[t]];
    const int32_t phase = state_phase[path[t]];
    const bool changed = lag != previous_lag || phase != previous_phase;
    if (static_cast<double>(t - last) > min_beat_spacing * lag &&
        (t % lag == phase || changed)) {
      frames.push_back(t);
      last = t;
    }
    previous_lag = lag;
    previous_phase = phase;
  }
  return frames;
}

std::vector<double> BeatFramesToSeconds(const std::vector<int32_t>& frames,
                                        int32_t leading_trimmed,
                                        int32_t frames_per_second) {
  const double seconds_per_frame = 1.0 / frames_per_second;
  std::vector<double> times(frames.size());
  for (size_t i = 0; i < frames.size(); ++i) {
    times[i] =
        (static_cast<double>(frames[i]) + leading_trimmed) * seconds_per_frame;
  }
  return times;
}

}  // namespace apm
