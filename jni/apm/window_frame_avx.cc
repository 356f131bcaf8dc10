#include "jni/apm/window_frame_avx.h"

#include <immintrin.h>

namespace apm {

void WindowFrameAvx(const float* samples, const double* window,
                    int32_t window_length, int32_t fft_length, double* buffer) {
  int32_t j = 0;
  // Two steps per pass: the loop's own instructions weigh on one.
  for (; j + 8 <= window_length; j += 8) {
    const __m256d x = _mm256_cvtps_pd(_mm_loadu_ps(samples + j));
    const __m256d y = _mm256_cvtps_pd(_mm_loadu_ps(samples + j + 4));
    _mm256_storeu_pd(buffer + j, _mm256_mul_pd(_mm256_loadu_pd(window + j), x));
    _mm256_storeu_pd(buffer + j + 4,
                     _mm256_mul_pd(_mm256_loadu_pd(window + j + 4), y));
  }
  for (; j + 4 <= window_length; j += 4) {
    const __m256d x = _mm256_cvtps_pd(_mm_loadu_ps(samples + j));
    _mm256_storeu_pd(buffer + j, _mm256_mul_pd(_mm256_loadu_pd(window + j), x));
  }
  for (; j < window_length; ++j) {
    buffer[j] = window[j] * static_cast<double>(samples[j]);
  }
  const __m256d zero = _mm256_setzero_pd();
  for (; j + 4 <= fft_length; j += 4) _mm256_storeu_pd(buffer + j, zero);
  for (; j < fft_length; ++j) buffer[j] = 0.0;
}

}  // namespace apm
