// Four doubles in one AVX register, taken as two Double2 values side by
// side: every operation of complex_ops.h acts on each 128-bit half exactly
// as it acts on a Double2 (shuffles never cross the halves), so a kernel run
// over Double4 does the work of two Double2 kernels on neighbouring elements
// and gives their bits. Only for translation units built with AVX.
#ifndef CLIPWEAVER_FFT_DOUBLE4_H_
#define CLIPWEAVER_FFT_DOUBLE4_H_

#include <immintrin.h>

#include "fft/complex_ops.h"

#if !defined(__AVX__)
#error "fft/double4.h needs a translation unit built with AVX"
#endif

namespace fft_internal {
inline namespace CLIPWEAVER_ISA {

struct Double4 {
  __m256d v;
};
template <>
inline Double4 Load<Double4>(const double* p) {
  return {_mm256_loadu_pd(p)};
}
// (lo, hi) in both halves.
template <>
inline Double4 Make<Double4>(double lo, double hi) {
  return {_mm256_set_pd(hi, lo, hi, lo)};
}
inline void Store(double* p, Double4 a) { _mm256_storeu_pd(p, a.v); }
inline Double4 operator+(Double4 a, Double4 b) { return {_mm256_add_pd(a.v, b.v)}; }
inline Double4 operator-(Double4 a, Double4 b) { return {_mm256_sub_pd(a.v, b.v)}; }
inline Double4 operator*(Double4 a, Double4 b) { return {_mm256_mul_pd(a.v, b.v)}; }
inline Double4 Neg(Double4 a) { return {_mm256_xor_pd(a.v, _mm256_set1_pd(-0.0))}; }
inline Double4 Swap(Double4 a) { return {_mm256_permute_pd(a.v, 0x5)}; }
inline Double4 DupLow(Double4 a) { return {_mm256_permute_pd(a.v, 0x0)}; }
inline Double4 DupHigh(Double4 a) { return {_mm256_permute_pd(a.v, 0xF)}; }
inline Double4 UnpackLow(Double4 a, Double4 b) { return {_mm256_unpacklo_pd(a.v, b.v)}; }
inline Double4 UnpackHigh(Double4 a, Double4 b) { return {_mm256_unpackhi_pd(a.v, b.v)}; }

// The two halves from two Double2.
inline Double4 Join(Double2 low, Double2 high) {
  return {_mm256_insertf128_pd(_mm256_castpd128_pd256(low.v), high.v, 1)};
}
// The low halves of a and b, and their high halves.
inline Double4 LowHalves(Double4 a, Double4 b) { return {_mm256_permute2f128_pd(a.v, b.v, 0x20)}; }
inline Double4 HighHalves(Double4 a, Double4 b) { return {_mm256_permute2f128_pd(a.v, b.v, 0x31)}; }
// The halves exchanged.
inline Double4 SwapHalves(Double4 a) { return {_mm256_permute2f128_pd(a.v, a.v, 1)}; }
// The low half of a and the high half of b.
inline Double4 HighFrom(Double4 a, Double4 b) { return {_mm256_blend_pd(a.v, b.v, 0xC)}; }

}  // namespace CLIPWEAVER_ISA
}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_DOUBLE4_H_
