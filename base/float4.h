// Four single-precision lanes, with SSE2 on x86-64, NEON on arm64 and plain
// arrays elsewhere. Every operation is the correctly rounded IEEE operation
// lane by lane (no fused multiply-add, no approximate reciprocal), so all
// three give the same bits as scalar code doing the same steps.
//
// The same names are defined for a single float, so that a kernel written
// once as a template over V = Float4 or float runs four elements at a time
// and one at a time for the tail.
#ifndef CLIPWEAVER_BASE_FLOAT4_H_
#define CLIPWEAVER_BASE_FLOAT4_H_

#include "base/instruction_set.h"

#include <cmath>

#if defined(CLIPWEAVER_SSE2)
#include <emmintrin.h>
#elif defined(CLIPWEAVER_NEON)
#include <arm_neon.h>
#endif

namespace simd {
inline namespace CLIPWEAVER_ISA {

template <typename V>
V Load(const float* p);
template <typename V>
V Splat(float a);

template <>
inline float Load<float>(const float* p) {
  return *p;
}
template <>
inline float Splat<float>(float a) {
  return a;
}
inline void Store(float* p, float a) { *p = a; }
inline float Sqrt(float a) { return std::sqrt(a); }
// 1 where the value is zero, 0 elsewhere.
inline float OneIfZero(float a) { return a == 0.0f ? 1.0f : 0.0f; }
// (re, im) pairs at p: the real parts and the imaginary parts.
inline void LoadComplex(const float* p, float* re, float* im) {
  *re = p[0];
  *im = p[1];
}
// The same from doubles, each rounded to the nearest float.
inline void LoadComplex(const double* p, float* re, float* im) {
  *re = static_cast<float>(p[0]);
  *im = static_cast<float>(p[1]);
}

#if defined(CLIPWEAVER_SSE2)

struct Float4 {
  __m128 v;
};
template <>
inline Float4 Splat<Float4>(float a) {
  return {_mm_set1_ps(a)};
}
template <>
inline Float4 Load<Float4>(const float* p) {
  return {_mm_loadu_ps(p)};
}
inline void Store(float* p, Float4 a) { _mm_storeu_ps(p, a.v); }
inline Float4 operator+(Float4 a, Float4 b) { return {_mm_add_ps(a.v, b.v)}; }
inline Float4 operator-(Float4 a, Float4 b) { return {_mm_sub_ps(a.v, b.v)}; }
inline Float4 operator*(Float4 a, Float4 b) { return {_mm_mul_ps(a.v, b.v)}; }
inline Float4 operator/(Float4 a, Float4 b) { return {_mm_div_ps(a.v, b.v)}; }
inline Float4 Sqrt(Float4 a) { return {_mm_sqrt_ps(a.v)}; }
inline Float4 OneIfZero(Float4 a) {
  return {_mm_and_ps(_mm_cmpeq_ps(a.v, _mm_setzero_ps()), _mm_set1_ps(1.0f))};
}
inline void LoadComplex(const float* p, Float4* re, Float4* im) {
  const __m128 low = _mm_loadu_ps(p);
  const __m128 high = _mm_loadu_ps(p + 4);
  re->v = _mm_shuffle_ps(low, high, _MM_SHUFFLE(2, 0, 2, 0));
  im->v = _mm_shuffle_ps(low, high, _MM_SHUFFLE(3, 1, 3, 1));
}
inline void LoadComplex(const double* p, Float4* re, Float4* im) {
  const __m128 low = _mm_movelh_ps(_mm_cvtpd_ps(_mm_loadu_pd(p)), _mm_cvtpd_ps(_mm_loadu_pd(p + 2)));
  const __m128 high =
      _mm_movelh_ps(_mm_cvtpd_ps(_mm_loadu_pd(p + 4)), _mm_cvtpd_ps(_mm_loadu_pd(p + 6)));
  re->v = _mm_shuffle_ps(low, high, _MM_SHUFFLE(2, 0, 2, 0));
  im->v = _mm_shuffle_ps(low, high, _MM_SHUFFLE(3, 1, 3, 1));
}

#elif defined(CLIPWEAVER_NEON)

struct Float4 {
  float32x4_t v;
};
template <>
inline Float4 Splat<Float4>(float a) {
  return {vdupq_n_f32(a)};
}
template <>
inline Float4 Load<Float4>(const float* p) {
  return {vld1q_f32(p)};
}
inline void Store(float* p, Float4 a) { vst1q_f32(p, a.v); }
inline Float4 operator+(Float4 a, Float4 b) { return {vaddq_f32(a.v, b.v)}; }
inline Float4 operator-(Float4 a, Float4 b) { return {vsubq_f32(a.v, b.v)}; }
inline Float4 operator*(Float4 a, Float4 b) { return {vmulq_f32(a.v, b.v)}; }
inline Float4 operator/(Float4 a, Float4 b) { return {vdivq_f32(a.v, b.v)}; }
inline Float4 Sqrt(Float4 a) { return {vsqrtq_f32(a.v)}; }
inline Float4 OneIfZero(Float4 a) {
  const uint32x4_t zero = vceqq_f32(a.v, vdupq_n_f32(0.0f));
  return {vreinterpretq_f32_u32(
      vandq_u32(zero, vreinterpretq_u32_f32(vdupq_n_f32(1.0f))))};
}
inline void LoadComplex(const float* p, Float4* re, Float4* im) {
  const float32x4x2_t pairs = vld2q_f32(p);
  re->v = pairs.val[0];
  im->v = pairs.val[1];
}
inline void LoadComplex(const double* p, Float4* re, Float4* im) {
  const float64x2x2_t low = vld2q_f64(p);
  const float64x2x2_t high = vld2q_f64(p + 4);
  re->v = vcombine_f32(vcvt_f32_f64(low.val[0]), vcvt_f32_f64(high.val[0]));
  im->v = vcombine_f32(vcvt_f32_f64(low.val[1]), vcvt_f32_f64(high.val[1]));
}

#else

struct Float4 {
  float v[4];
};
template <>
inline Float4 Splat<Float4>(float a) {
  return {{a, a, a, a}};
}
template <>
inline Float4 Load<Float4>(const float* p) {
  return {{p[0], p[1], p[2], p[3]}};
}
inline void Store(float* p, Float4 a) {
  for (int i = 0; i < 4; ++i) p[i] = a.v[i];
}
#define CLIPWEAVER_FLOAT4_LANEWISE(op)                    \
  inline Float4 operator op(Float4 a, Float4 b) {         \
    for (int i = 0; i < 4; ++i) a.v[i] = a.v[i] op b.v[i]; \
    return a;                                             \
  }
CLIPWEAVER_FLOAT4_LANEWISE(+)
CLIPWEAVER_FLOAT4_LANEWISE(-)
CLIPWEAVER_FLOAT4_LANEWISE(*)
CLIPWEAVER_FLOAT4_LANEWISE(/)
#undef CLIPWEAVER_FLOAT4_LANEWISE
inline Float4 Sqrt(Float4 a) {
  for (int i = 0; i < 4; ++i) a.v[i] = std::sqrt(a.v[i]);
  return a;
}
inline Float4 OneIfZero(Float4 a) {
  for (int i = 0; i < 4; ++i) a.v[i] = OneIfZero(a.v[i]);
  return a;
}
inline void LoadComplex(const float* p, Float4* re, Float4* im) {
  for (int i = 0; i < 4; ++i) {
    re->v[i] = p[2 * i];
    im->v[i] = p[2 * i + 1];
  }
}
inline void LoadComplex(const double* p, Float4* re, Float4* im) {
  for (int i = 0; i < 4; ++i) {
    re->v[i] = static_cast<float>(p[2 * i]);
    im->v[i] = static_cast<float>(p[2 * i + 1]);
  }
}

#endif

}  // namespace CLIPWEAVER_ISA
}  // namespace simd

#endif  // CLIPWEAVER_BASE_FLOAT4_H_
