// The onset detector's bins eight at a time, built apart with AVX. Call
// only where instruction_set::HasAvx(); returns how many of the first bins
// it did (a multiple of 8), leaving the rest to the narrower kernels. The
// distances add into lanes[4] four lanes wide, in the order of the Float4
// kernel.
#ifndef CLIPWEAVER_JNI_APM_ONSET_BINS_AVX_H_
#define CLIPWEAVER_JNI_APM_ONSET_BINS_AVX_H_

#include <cstdint>

namespace apm {

int32_t DetectBinsAvx(const float* bins, int32_t bin_count, float* previous_magnitude,
                      float* u1_re, float* u1_im, float* u2_re, float* u2_im, float* lanes);
int32_t DetectBinsAvx(const double* bins, int32_t bin_count, float* previous_magnitude,
                      float* u1_re, float* u1_im, float* u2_re, float* u2_im, float* lanes);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_ONSET_BINS_AVX_H_
