#include "jni/apm/frame_transform.h"

#include "base/instruction_set.h"
#include "fft/real_fft.h"
#include "jni/apm/window_frame_avx.h"

namespace apm {

void TransformFrame(const float* samples, const double* window,
                    int32_t window_length, int32_t fft_length, double* buffer,
                    int* bit_reversal_work, double* twiddle_table) {
#if defined(__x86_64__)
  if (instruction_set::HasAvx()) {
    WindowFrameAvx(samples, window, window_length, fft_length, buffer);
  } else
#endif
  {
    for (int32_t j = 0; j < window_length; ++j) {
      buffer[j] = window[j] * static_cast<double>(samples[j]);
    }
    for (int32_t j = window_length; j < fft_length; ++j) buffer[j] = 0.0;
  }
  RealFft(fft_length, 1, buffer, bit_reversal_work, twiddle_table);
  buffer[fft_length] = buffer[1];
  buffer[fft_length + 1] = 0.0;
  buffer[1] = 0.0;
}

}  // namespace apm
