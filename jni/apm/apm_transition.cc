#include "jni/apm/apm_transition.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>

#include "base/instruction_set.h"
#include "jni/apm/score_state_avx.h"

// Why ScoreOnBeat gives the naive pass's results bit for bit. For a lag j,
// the score of entry k is fl(base[k] + x), and x only depends on the period
// term and the phase term. Past a certain difference each table holds one
// value (the Gaussian underflows against the epsilon), so the entries fall
// into groups with one x: same lag and same phase class for the lags near
// j, same phase class for all the far ones. Rounding is monotone, so in a
// group the largest base gives the largest score, and another member can
// only tie it if the two bases lie within one ulp of the score, i.e. within
// delta. Entries with a neighbour that close ("crowded") are always scored;
// the others only where they have the largest base of their group.
//
// Further, the class top with the largest key (base plus phase term), the
// leader, is scored at every lag. Outside its own near lags, an entry whose
// key plus its best period gain over the tail is below the leader's key by
// more than the rounding of the sums (margin) scores strictly less, so it
// is scored only at the leader's near lags; not even there if no near
// period term is below the tail's, as the leader then does no worse.
//
// Every entry that could be first with the best score is scored, and ties
// go to the earlier entry, so the result is the naive pass's.

namespace apm {
namespace {

// Inputs up to this size cannot make a sum of five of them overflow.
constexpr double kLargest = 1e300;
// Phase tables whose tail starts later hold a Gaussian so wide that the
// groups would not save anything.
constexpr int32_t kMostPhaseClasses = 64;

// The first index from which every entry has the bits of the last one.
int32_t TailStart(const std::vector<double>& table) {
  int32_t d = static_cast<int32_t>(table.size()) - 1;
  while (d > 0 &&
         std::memcmp(&table[d - 1], &table.back(), sizeof(double)) == 0) {
    --d;
  }
  return d;
}

bool Bounded(const double* v, size_t n, double* max_abs) {
  double largest = 0.0;
  for (size_t i = 0; i < n; ++i) {
    const double a = std::abs(v[i]);
    if (!(a <= kLargest)) return false;
    largest = std::max(largest, a);
  }
  *max_abs = largest;
  return true;
}

// Bounded for the bases of a beam of count >= 1 entries, telling on the
// way whether they ascend (the beam's usual order, which Keep takes as it
// is then) and, if so, the least step between neighbours. Ascending bases
// lie between the first and the last, which bound them all.
bool BoundedBases(const double* base, int32_t count, double* max_abs,
                  bool* ascending, double* least_step) {
  bool up = true;
  double step = std::numeric_limits<double>::infinity();
  for (int32_t k = 1; k < count; ++k) {
    const double d = base[k] - base[k - 1];
    up &= d >= 0.0;
    step = std::min(step, d);
  }
  *ascending = up;
  *least_step = step;
  if (up) {
    *max_abs = std::max(std::abs(base[0]), std::abs(base[count - 1]));
    return *max_abs <= kLargest;
  }
  return Bounded(base, count, max_abs);
}

// In any order of offers this keeps the first entry with the largest
// score, as a pass in beam order with a strict comparison does.
// Without branches: whether an offer wins is hard to predict.
inline void Offer(double score, int32_t entry, double* best, int32_t* from) {
  const bool wins = (score > *best) | ((score == *best) & (entry < *from));
  *best = wins ? score : *best;
  *from = wins ? entry : *from;
}

std::vector<double> ByDifference(const std::vector<double>& table,
                                 int32_t largest) {
  std::vector<double> terms(2 * largest + 1);
  for (int32_t d = -largest; d <= largest; ++d) {
    terms[d + largest] = table[std::min<size_t>(std::abs(d), table.size() - 1)];
  }
  return terms;
}

}  // namespace

void TransitionScorer::SetUp(int32_t lag_count, int32_t offset_range,
                             const std::vector<double>& period_change_score,
                             const std::vector<double>& phase_deviation_score) {
  lag_count_ = lag_count;
  offset_range_ = offset_range;
  avx_ = instruction_set::HasAvx();
  period_ = period_change_score;
  phase_ = phase_deviation_score;
  period_by_difference_ = ByDifference(period_, lag_count - 1);
  phase_by_difference_ = ByDifference(phase_, offset_range);
  usable_ = !period_.empty() && !phase_.empty() &&
            Bounded(period_.data(), period_.size(), &period_max_abs_) &&
            Bounded(phase_.data(), phase_.size(), &phase_max_abs_);
  if (!usable_) return;
  // Lags never differ by lag_count or more.
  period_tail_ = std::min(TailStart(period_), lag_count);
  phase_tail_ = TailStart(phase_);
  usable_ = phase_tail_ < kMostPhaseClasses;
  period_gain_ = 0.0;
  near_at_least_tail_ = true;
  for (int32_t d = 0; d < period_tail_; ++d) {
    period_gain_ = std::max(period_gain_, period_[d] - period_.back());
    near_at_least_tail_ &= period_[d] >= period_.back();
  }
  seen_.Reset(static_cast<size_t>(lag_count) * kMostPhaseClasses);
}

bool TransitionScorer::ScoreOnBeat(const BeamEntries& entries,
                                   const double* observation,
                                   const double* prior, double* best,
                                   int32_t* from) {
  double base_max = 0.0;
  double observation_max = 0.0;
  double prior_max = 0.0;
  bool ascending = false;
  double least_step = 0.0;
  if (!usable_ || entries.count < 1 ||
      !BoundedBases(entries.base, entries.count, &base_max, &ascending,
                    &least_step) ||
      !Bounded(observation, lag_count_, &observation_max) ||
      !Bounded(prior, lag_count_, &prior_max)) {
    return false;
  }
  // Two sums rounding to the same double s differ by at most ulp(s), which
  // is at most 2^-52 |s| or the smallest subnormal; |s| is below this bound
  // plus a little rounding. Four times that leaves room for the rounding
  // of the differences compared with it. A score is off the exact sum of
  // its five terms by three roundings, keys and gains by a few more: the
  // margin covers them all many times over.
  const double bound =
      base_max + observation_max + period_max_abs_ + phase_max_abs_ + prior_max;
  // Scaled by products, which round as ldexp does.
  delta_ = bound * 0x1p-50 + 16 * std::numeric_limits<double>::denorm_min();
  margin_ = bound * 0x1p-46 + 16 * std::numeric_limits<double>::denorm_min();
  Keep(entries, ascending, ascending && least_step > delta_);
  FindLeader();
  std::fill_n(best, lag_count_, -std::numeric_limits<double>::infinity());
  std::fill_n(from, lag_count_, entries.count);
  ScoreNear(observation, prior, best, from);
  ScoreFar(observation, prior, best, from);
  return true;
}

void TransitionScorer::ScoreState(const BeamEntries& entries, int32_t lag,
                                  int32_t offset, double observation,
                                  double prior, double* best,
                                  int32_t* from) const {
  // Looked up by signed difference: the loop neither folds nor clips.
  const double* period = period_by_difference_.data() + lag_count_ - 1 - lag;
  const double* phase = phase_by_difference_.data() + offset_range_ - offset;
#if defined(__x86_64__)
  if (avx_) {
    ScoreStateAvx(entries.base, entries.lag, entries.offset, entries.count,
                  period, phase, observation, prior, best, from);
    return;
  }
#endif
  double top = *best;
  int32_t top_from = *from;
  for (int32_t k = 0; k < entries.count; ++k) {
    const double score =
        entries.base[k] +
        (((observation + period[entries.lag[k]]) + phase[entries.offset[k]]) +
         prior);
    if (score > top) {
      top = score;
      top_from = k;
    }
  }
  *best = top;
  *from = top_from;
}

// Entries by descending base. The beam comes out of the selection in
// ascending order of value, so this is usually a reversal, taken without
// an index table; spaced (no two bases within delta) then too, so that no
// entry is crowded.
void TransitionScorer::Keep(const BeamEntries& entries, bool ascending,
                            bool spaced) {
  const int32_t count = entries.count;
  const double* base = entries.base;
  const auto reversed = [count](int32_t i) { return count - 1 - i; };
  if (spaced) {
    KeepInOrder<false>(entries, reversed);
  } else if (ascending) {
    KeepInOrder<true>(entries, reversed);
  } else {
    order_.resize(count);
    for (int32_t k = 0; k < count; ++k) order_[k] = count - 1 - k;
    std::sort(order_.begin(), order_.end(),
              [base](int32_t a, int32_t b) { return base[a] > base[b]; });
    KeepInOrder<true>(entries, [this](int32_t i) { return order_[i]; });
  }
  // Kept entries by class, keeping their order within a class.
  const int32_t class_count = phase_tail_ + 1;
  class_start_.assign(class_count + 1, 0);
  for (int32_t i = 0; i < kept_count_; ++i) ++class_start_[kept_[i].phase_class + 1];
  for (int32_t q = 0; q < class_count; ++q) {
    class_start_[q + 1] += class_start_[q];
  }
  by_class_.resize(kept_count_);
  fill_.assign(class_start_.begin(), class_start_.end() - 1);
  for (int32_t i = 0; i < kept_count_; ++i) {
    by_class_[fill_[kept_[i].phase_class]++] = i;
  }
}

// Entry index(i) is the i-th by descending base; with kMayCrowd false no
// two are within delta. Members are read into locals first: the stores of
// the loop could alias them for all the compiler knows.
template <bool kMayCrowd, typename Index>
void TransitionScorer::KeepInOrder(const BeamEntries& entries, Index index) {
  seen_.NextGeneration();
  const GenerationMarks::Marker seen = seen_.Hold();
  const int32_t count = entries.count;
  if (kept_.size() < static_cast<size_t>(count)) kept_.resize(count);
  if (close_.size() < static_cast<size_t>(count) + 1) close_.resize(count + 1);
  const double* const bases = entries.base;
  const int32_t* const lags = entries.lag;
  const int32_t* const offsets = entries.offset;
  // close[i]: whether entries i - 1 and i are within delta. A pass of its
  // own leaves the loop below few enough values for the registers.
  uint8_t* const close = close_.data();
  if (kMayCrowd) {
    const double delta = delta_;
    close[0] = 0;
    for (int32_t i = 1; i < count; ++i) {
      close[i] = bases[index(i - 1)] - bases[index(i)] <= delta;
    }
    close[count] = 0;
  }
  const int32_t phase_tail = phase_tail_;
  Kept* out = kept_.data();
  for (int32_t i = 0; i < count; ++i) {
    const int32_t e = index(i);
    const int32_t lag = lags[e];
    const int32_t phase_class = std::min(std::abs(offsets[e]), phase_tail);
    const bool first = seen.Mark(static_cast<size_t>(lag) * kMostPhaseClasses + phase_class);
    const bool crowded = kMayCrowd && (close[i] | close[i + 1]);
    // Written in any case, counted only when kept: fewer branches.
    out->base = bases[e];
    out->lag = lag;
    out->phase_class = phase_class;
    out->entry = e;
    out->crowded = crowded;
    out += first | crowded;
  }
  kept_count_ = static_cast<int32_t>(out - kept_.data());
}

void TransitionScorer::FindLeader() {
  lead_ = -std::numeric_limits<double>::infinity();
  for (size_t q = 0; q + 1 < class_start_.size(); ++q) {
    if (class_start_[q] == class_start_[q + 1]) continue;
    const Kept& top = kept_[by_class_[class_start_[q]]];
    if (top.base + phase_[q] > lead_) {
      lead_ = top.base + phase_[q];
      lead_lag_ = top.lag;
    }
  }
}

// Narrows first .. last to the leader's near lags when the key cannot
// reach the leader's, or to nothing when the leader does no worse at its
// near lags than at the far ones.
void TransitionScorer::Limit(double key, int32_t* first, int32_t* last) const {
  if (key < lead_ - margin_) {
    *first = std::max(*first, lead_lag_ - period_tail_ + 1);
    *last = std::min(*last, lead_lag_ + period_tail_ - 1);
    if (near_at_least_tail_) *last = *first - 1;
  }
}

// The lags closer to an entry's own than the period table's tail.
void TransitionScorer::ScoreNear(const double* observation, const double* prior,
                                 double* best, int32_t* from) const {
  for (int32_t i = 0; i < kept_count_; ++i) {
    const Kept& k = kept_[i];
    const double phase = phase_[k.phase_class];
    const double* period = period_by_difference_.data() + lag_count_ - 1 - k.lag;
    int32_t first = std::max(0, k.lag - period_tail_ + 1);
    int32_t last = std::min(lag_count_ - 1, k.lag + period_tail_ - 1);
    Limit(k.base + phase + period_gain_, &first, &last);
    for (int32_t j = first; j <= last; ++j) {
      const double score = k.base + (((observation[j] + period[j]) + phase) + prior[j]);
      Offer(score, k.entry, &best[j], &from[j]);
    }
  }
}

// All far entries of a phase class share one x; the first of them in the
// class's list has the largest base.
void TransitionScorer::ScoreFar(const double* observation, const double* prior,
                                double* best, int32_t* from) const {
  const double tail = period_.back();
  for (size_t q = 0; q + 1 < class_start_.size(); ++q) {
    const int32_t* members = by_class_.data() + class_start_[q];
    const int32_t size = class_start_[q + 1] - class_start_[q];
    if (size == 0) continue;
    const double phase = phase_[q];
    const Kept& top = kept_[members[0]];
    int32_t first = 0;
    int32_t last = lag_count_ - 1;
    Limit(top.base + phase, &first, &last);
    // Most lags are far from the class's top entry, and the top is rarely
    // crowded: those lags need neither the walk nor the tie check.
    const int32_t near_first = top.crowded ? first : top.lag - period_tail_ + 1;
    const int32_t near_last = top.crowded ? last : top.lag + period_tail_ - 1;
    const auto far_run = [&](int32_t begin, int32_t end) {
      for (int32_t j = begin; j <= end; ++j) {
        const double x = ((observation[j] + tail) + phase) + prior[j];
        Offer(top.base + x, top.entry, &best[j], &from[j]);
      }
    };
    far_run(first, std::min(last, near_first - 1));
    for (int32_t j = std::max(first, near_first); j <= std::min(last, near_last);
         ++j) {
      int32_t i = 0;
      if (std::abs(top.lag - j) < period_tail_) {
        for (i = 1;
             i < size && std::abs(kept_[members[i]].lag - j) < period_tail_;
             ++i) {
        }
        if (i == size) continue;
      }
      const double x = ((observation[j] + tail) + phase) + prior[j];
      const Kept& head = kept_[members[i]];
      Offer(head.base + x, head.entry, &best[j], &from[j]);
      if (!head.crowded) continue;
      for (++i; i < size && head.base - kept_[members[i]].base <= delta_; ++i) {
        const Kept& k = kept_[members[i]];
        if (std::abs(k.lag - j) >= period_tail_) {
          Offer(k.base + x, k.entry, &best[j], &from[j]);
        }
      }
    }
    far_run(std::max(first, near_last + 1), last);
  }
}

}  // namespace apm
