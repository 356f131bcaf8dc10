#include "jni/apm/score_state_avx.h"

#include <immintrin.h>

namespace apm {

void ScoreStateAvx(const double* base, const int32_t* lag,
                   const int32_t* offset, int32_t count, const double* period,
                   const double* phase, double observation, double prior,
                   double* best, int32_t* from) {
  // Lane l keeps the first of its entries k = l mod 4 above *best with the
  // largest score; the first lane entry among the largest is the winner.
  const __m256d observations = _mm256_set1_pd(observation);
  const __m256d priors = _mm256_set1_pd(prior);
  __m256d top = _mm256_set1_pd(*best);
  __m256d winner = _mm256_set1_pd(-1.0);
  __m256d at = _mm256_setr_pd(0.0, 1.0, 2.0, 3.0);
  const __m256d four = _mm256_set1_pd(4.0);
  int32_t k = 0;
  for (; k + 4 <= count; k += 4) {
    const __m256d period_terms =
        _mm256_setr_pd(period[lag[k]], period[lag[k + 1]], period[lag[k + 2]],
                       period[lag[k + 3]]);
    const __m256d phase_terms =
        _mm256_setr_pd(phase[offset[k]], phase[offset[k + 1]],
                       phase[offset[k + 2]], phase[offset[k + 3]]);
    const __m256d x = _mm256_add_pd(
        _mm256_add_pd(_mm256_add_pd(observations, period_terms), phase_terms),
        priors);
    const __m256d score = _mm256_add_pd(_mm256_loadu_pd(base + k), x);
    const __m256d wins = _mm256_cmp_pd(score, top, _CMP_GT_OQ);
    // The maximum and masks rather than blends, which GCC turns into
    // scalar code here.
    top = _mm256_max_pd(score, top);
    winner = _mm256_or_pd(_mm256_and_pd(wins, at), _mm256_andnot_pd(wins, winner));
    at = _mm256_add_pd(at, four);
  }
  double tops[4];
  double winners[4];
  _mm256_storeu_pd(tops, top);
  _mm256_storeu_pd(winners, winner);
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

}  // namespace apm
