// The windowing kernel of frame_transform.h, built apart with AVX; the
// same bits as the plain loop. Call only where instruction_set::HasAvx().
#ifndef CLIPWEAVER_JNI_APM_WINDOW_FRAME_AVX_H_
#define CLIPWEAVER_JNI_APM_WINDOW_FRAME_AVX_H_

#include <cstdint>

namespace apm {

// buffer[j] = window[j] * samples[j] in double for j < window_length, then
// zeros up to fft_length.
void WindowFrameAvx(const float* samples, const double* window,
                    int32_t window_length, int32_t fft_length, double* buffer);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_WINDOW_FRAME_AVX_H_
