// Eight single-precision lanes in one AVX register, with the operations of
// float4.h and the same rounding lane by lane, so that a kernel written over
// V gives the bits of Float4 and float. Only for translation units built
// with AVX.
#ifndef CLIPWEAVER_BASE_FLOAT8_H_
#define CLIPWEAVER_BASE_FLOAT8_H_

#include <immintrin.h>

#include "base/float4.h"

#if !defined(__AVX__)
#error "base/float8.h needs a translation unit built with AVX"
#endif

namespace simd {
inline namespace CLIPWEAVER_ISA {

struct Float8 {
  __m256 v;
};
template <>
inline Float8 Splat<Float8>(float a) {
  return {_mm256_set1_ps(a)};
}
template <>
inline Float8 Load<Float8>(const float* p) {
  return {_mm256_loadu_ps(p)};
}
inline void Store(float* p, Float8 a) { _mm256_storeu_ps(p, a.v); }
inline Float8 operator+(Float8 a, Float8 b) { return {_mm256_add_ps(a.v, b.v)}; }
inline Float8 operator-(Float8 a, Float8 b) { return {_mm256_sub_ps(a.v, b.v)}; }
inline Float8 operator*(Float8 a, Float8 b) { return {_mm256_mul_ps(a.v, b.v)}; }
inline Float8 operator/(Float8 a, Float8 b) { return {_mm256_div_ps(a.v, b.v)}; }
inline Float8 Sqrt(Float8 a) { return {_mm256_sqrt_ps(a.v)}; }
inline Float8 OneIfZero(Float8 a) {
  return {_mm256_and_ps(_mm256_cmp_ps(a.v, _mm256_setzero_ps(), _CMP_EQ_OQ),
                        _mm256_set1_ps(1.0f))};
}
// Halves of four pairs each, so that the in-lane shuffle lines the parts up
// in order.
inline void LoadComplex(const float* p, Float8* re, Float8* im) {
  const __m256 first = _mm256_insertf128_ps(_mm256_castps128_ps256(_mm_loadu_ps(p)),
                                            _mm_loadu_ps(p + 8), 1);
  const __m256 second = _mm256_insertf128_ps(_mm256_castps128_ps256(_mm_loadu_ps(p + 4)),
                                             _mm_loadu_ps(p + 12), 1);
  re->v = _mm256_shuffle_ps(first, second, _MM_SHUFFLE(2, 0, 2, 0));
  im->v = _mm256_shuffle_ps(first, second, _MM_SHUFFLE(3, 1, 3, 1));
}
// The same from doubles, each rounded to the nearest float: four pairs
// convert into each half.
inline void LoadComplex(const double* p, Float8* re, Float8* im) {
  const __m256 first = _mm256_insertf128_ps(
      _mm256_castps128_ps256(_mm256_cvtpd_ps(_mm256_loadu_pd(p))),
      _mm256_cvtpd_ps(_mm256_loadu_pd(p + 8)), 1);
  const __m256 second = _mm256_insertf128_ps(
      _mm256_castps128_ps256(_mm256_cvtpd_ps(_mm256_loadu_pd(p + 4))),
      _mm256_cvtpd_ps(_mm256_loadu_pd(p + 12)), 1);
  re->v = _mm256_shuffle_ps(first, second, _MM_SHUFFLE(2, 0, 2, 0));
  im->v = _mm256_shuffle_ps(first, second, _MM_SHUFFLE(3, 1, 3, 1));
}
// Lanes 0-3 and 4-7.
inline Float4 LowHalf(Float8 a) { return {_mm256_castps256_ps128(a.v)}; }
inline Float4 HighHalf(Float8 a) { return {_mm256_extractf128_ps(a.v, 1)}; }

}  // namespace CLIPWEAVER_ISA
}  // namespace simd

#endif  // CLIPWEAVER_BASE_FLOAT8_H_
