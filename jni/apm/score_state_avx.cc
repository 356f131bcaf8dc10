#include "jni/apm/score_state_avx.h"

#include <immintrin.h>

#include "base/instruction_set.h"

namespace apm {
namespace {

// Lane l keeps the first of its entries k = l mod 4 above *best with the
// largest score; the first lane entry among the largest is the winner.
struct Lanes {
  __m256d top;
  __m256d winner;
  __m256d at;
};

// Entries k .. k + 3, given their table terms. The helpers are inlined
// into the AVX2 loop as well, which may take AVX code.
__attribute__((always_inline)) inline void ScoreFour(const double* base, __m256d period_terms,
                                                     __m256d phase_terms, __m256d observations,
                                                     __m256d priors, Lanes* lanes) {
  const __m256d x = _mm256_add_pd(
      _mm256_add_pd(_mm256_add_pd(observations, period_terms), phase_terms), priors);
  const __m256d score = _mm256_add_pd(_mm256_loadu_pd(base), x);
  const __m256d wins = _mm256_cmp_pd(score, lanes->top, _CMP_GT_OQ);
  // The maximum and masks rather than blends, which GCC turns into
  // scalar code here.
  lanes->top = _mm256_max_pd(score, lanes->top);
  lanes->winner =
      _mm256_or_pd(_mm256_and_pd(wins, lanes->at), _mm256_andnot_pd(wins, lanes->winner));
  lanes->at = _mm256_add_pd(lanes->at, _mm256_set1_pd(4.0));
}

// The winner of the lanes, then the entries from k on one by one.
__attribute__((always_inline)) inline void Settle(const Lanes& lanes, int32_t k,
                                                  const double* base, const int32_t* lag,
                                                  const int32_t* offset, int32_t count,
                                                  const double* period, const double* phase,
                                                  double observation, double prior,
                                                  double* best, int32_t* from) {
  double tops[4];
  double winners[4];
  _mm256_storeu_pd(tops, lanes.top);
  _mm256_storeu_pd(winners, lanes.winner);
  double top_score = *best;
  int32_t top_from = -1;
  for (int l = 0; l < 4; ++l) {
    if (winners[l] < 0) continue;
    const int32_t entry = static_cast<int32_t>(winners[l]);
    if (top_from == -1 || tops[l] > top_score ||
        (tops[l] == top_score && entry < top_from)) {
      top_score = tops[l];
      top_from = entry;
    }
  }
  for (; k < count; ++k) {
    const double score =
        base[k] + (((observation + period[lag[k]]) + phase[offset[k]]) + prior);
    if (score > top_score) {
      top_score = score;
      top_from = k;
    }
  }
  if (top_from != -1) {
    *best = top_score;
    *from = top_from;
  }
}

void ScoreBySets(const double* base, const int32_t* lag, const int32_t* offset, int32_t count,
                 const double* period, const double* phase, double observation, double prior,
                 double* best, int32_t* from) {
  const __m256d observations = _mm256_set1_pd(observation);
  const __m256d priors = _mm256_set1_pd(prior);
  Lanes lanes = {_mm256_set1_pd(*best), _mm256_set1_pd(-1.0),
                 _mm256_setr_pd(0.0, 1.0, 2.0, 3.0)};
  int32_t k = 0;
  for (; k + 4 <= count; k += 4) {
    ScoreFour(base + k,
              _mm256_setr_pd(period[lag[k]], period[lag[k + 1]], period[lag[k + 2]],
                             period[lag[k + 3]]),
              _mm256_setr_pd(phase[offset[k]], phase[offset[k + 1]], phase[offset[k + 2]],
                             phase[offset[k + 3]]),
              observations, priors, &lanes);
  }
  Settle(lanes, k, base, lag, offset, count, period, phase, observation, prior, best, from);
}

// The same with each table's four terms in one gather.
__attribute__((target("avx2"))) void ScoreByGathers(const double* base, const int32_t* lag,
                                                    const int32_t* offset, int32_t count,
                                                    const double* period, const double* phase,
                                                    double observation, double prior,
                                                    double* best, int32_t* from) {
  const __m256d observations = _mm256_set1_pd(observation);
  const __m256d priors = _mm256_set1_pd(prior);
  Lanes lanes = {_mm256_set1_pd(*best), _mm256_set1_pd(-1.0),
                 _mm256_setr_pd(0.0, 1.0, 2.0, 3.0)};
  // The masked form with every lane taken: the plain one leaves its
  // source register undefined, which costs more.
  const __m256d zero = _mm256_setzero_pd();
  const __m256d all = _mm256_castsi256_pd(_mm256_set1_epi64x(-1));
  int32_t k = 0;
  for (; k + 4 <= count; k += 4) {
    const __m128i lags = _mm_loadu_si128(reinterpret_cast<const __m128i*>(lag + k));
    const __m128i offsets = _mm_loadu_si128(reinterpret_cast<const __m128i*>(offset + k));
    ScoreFour(base + k, _mm256_mask_i32gather_pd(zero, period, lags, all, 8),
              _mm256_mask_i32gather_pd(zero, phase, offsets, all, 8), observations, priors,
              &lanes);
  }
  Settle(lanes, k, base, lag, offset, count, period, phase, observation, prior, best, from);
}

}  // namespace

void ScoreStateAvx(const double* base, const int32_t* lag,
                   const int32_t* offset, int32_t count, const double* period,
                   const double* phase, double observation, double prior,
                   double* best, int32_t* from) {
  static const bool gather = instruction_set::HasAvx2();
  if (gather) {
    ScoreByGathers(base, lag, offset, count, period, phase, observation, prior, best, from);
  } else {
    ScoreBySets(base, lag, offset, count, period, phase, observation, prior, best, from);
  }
}

}  // namespace apm
