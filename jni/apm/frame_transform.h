// One frame of the spectrogram through the real FFT, and its bins out to
// float: the AVX kernels where they run, the same bits either way.
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

// floats[i] = the float nearest bins[i] for i < 2 * bin_count.
void BinsToFloats(const double* bins, int32_t bin_count, float* floats);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_FRAME_TRANSFORM_H_
