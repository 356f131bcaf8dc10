// One frame of the spectrogram through the real FFT: the AVX windowing
// where it runs, the same bits either way.
#ifndef CLIPWEAVER_JNI_APM_FRAME_TRANSFORM_H_
#define CLIPWEAVER_JNI_APM_FRAME_TRANSFORM_H_

#include <cstdint>

namespace apm {

// Windows samples[0 .. window_length) in double, pads them with zeros to
// fft_length and transforms them in buffer (fft_length + 2 doubles), leaving
// the fft_length / 2 + 1 bins as (re, im) pairs. The work areas are those
// of RealFft.
void TransformFrame(const float* samples, const double* window,
                    int32_t window_length, int32_t fft_length, double* buffer,
                    int* bit_reversal_work, double* twiddle_table);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_FRAME_TRANSFORM_H_
