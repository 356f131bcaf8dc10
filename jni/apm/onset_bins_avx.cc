#include "jni/apm/onset_bins_avx.h"

#include "base/float8.h"
#include "jni/apm/onset_bins.h"

namespace apm {

int32_t DetectBinsAvx(const float* bins, int32_t bin_count, float* previous_magnitude,
                      float* u1_re, float* u1_im, float* u2_re, float* u2_im, float* distance) {
  int32_t k = 0;
  for (; k + 8 <= bin_count; k += 8) {
    DetectBins<simd::Float8>(bins, k, previous_magnitude, u1_re, u1_im, u2_re, u2_im, distance);
  }
  return k;
}

}  // namespace apm
