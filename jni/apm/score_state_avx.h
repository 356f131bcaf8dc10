// The loop of TransitionScorer::ScoreState four entries at a time, built
// apart with AVX. Call only where instruction_set::HasAvx().
#ifndef CLIPWEAVER_JNI_APM_SCORE_STATE_AVX_H_
#define CLIPWEAVER_JNI_APM_SCORE_STATE_AVX_H_

#include <cstdint>

namespace apm {

// Over k < count, the scores base[k] + (((observation + period[lag[k]]) +
// phase[offset[k]]) + prior); if the largest is above *best, it goes there
// and the first k that reaches it to *from, as a pass in order of k with a
// strict comparison leaves them.
void ScoreStateAvx(const double* base, const int32_t* lag,
                   const int32_t* offset, int32_t count, const double* period,
                   const double* phase, double observation, double prior,
                   double* best, int32_t* from);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_SCORE_STATE_AVX_H_
