#include "jni/apm/onset_bins_avx.h"

#include "base/float8.h"
#include "jni/apm/onset_bins.h"

namespace apm {
namespace {

template <typename T>
int32_t DetectBinsEight(const T* bins, int32_t bin_count, float* previous_magnitude,
                        float* u1_re, float* u1_im, float* u2_re, float* u2_im, float* lanes) {
  simd::Float4 sum = simd::Load<simd::Float4>(lanes);
  int32_t k = 0;
  for (; k + 8 <= bin_count; k += 8) {
    const simd::Float8 distance = DetectBins<simd::Float8>(bins, k, previous_magnitude, u1_re,
                                                           u1_im, u2_re, u2_im);
    sum = sum + simd::LowHalf(distance);
    sum = sum + simd::HighHalf(distance);
  }
  simd::Store(lanes, sum);
  return k;
}

}  // namespace

int32_t DetectBinsAvx(const float* bins, int32_t bin_count, float* previous_magnitude,
                      float* u1_re, float* u1_im, float* u2_re, float* u2_im, float* lanes) {
  return DetectBinsEight(bins, bin_count, previous_magnitude, u1_re, u1_im, u2_re, u2_im, lanes);
}

int32_t DetectBinsAvx(const double* bins, int32_t bin_count, float* previous_magnitude,
                      float* u1_re, float* u1_im, float* u2_re, float* u2_im, float* lanes) {
  return DetectBinsEight(bins, bin_count, previous_magnitude, u1_re, u1_im, u2_re, u2_im, lanes);
}

}  // namespace apm
