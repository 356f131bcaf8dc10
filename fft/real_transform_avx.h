// RealTransform with the radix-4 passes on Double4, built apart with AVX.
// Call only where instruction_set::HasAvx(); the bits are those of every
// other build.
#ifndef CLIPWEAVER_FFT_REAL_TRANSFORM_AVX_H_
#define CLIPWEAVER_FFT_REAL_TRANSFORM_AVX_H_

namespace fft_internal {

void RealTransformAvx(int n, int direction, double* data, const int* bit_reversal_work,
                      const double* twiddle_table);

}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_REAL_TRANSFORM_AVX_H_
