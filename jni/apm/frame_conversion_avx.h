// The kernels of frame_transform.h, built apart with AVX; the same bits as
// the plain casts. Call only where instruction_set::HasAvx().
#ifndef CLIPWEAVER_JNI_APM_FRAME_CONVERSION_AVX_H_
#define CLIPWEAVER_JNI_APM_FRAME_CONVERSION_AVX_H_

#include <cstdint>

namespace apm {

// buffer[j] = window[j] * samples[j] in double for j < window_length, then
// zeros up to fft_length.
void WindowFrameAvx(const float* samples, const double* window,
                    int32_t window_length, int32_t fft_length, double* buffer);

// floats[i] = the float nearest values[i] for the first i < count, a
// multiple of 8; returns how many it did.
int32_t DoublesToFloatsAvx(const double* values, int32_t count, float* floats);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_FRAME_CONVERSION_AVX_H_
