// One complex double as a value type, held in a 128-bit register where the
// target has one. Every operation rounds exactly like the scalar version
// (no fused multiply-add), so results do not depend on the target.
#ifndef CLIPWEAVER_FFT_COMPLEX_OPS_H_
#define CLIPWEAVER_FFT_COMPLEX_OPS_H_

#if defined(__SSE2__)
#include <emmintrin.h>
#elif defined(__ARM_NEON) && defined(__aarch64__)
#include <arm_neon.h>
#endif

namespace fft_internal {

#if defined(__SSE2__)

struct Cx {
  __m128d v;
};
inline Cx MakeCx(double re, double im) { return {_mm_set_pd(im, re)}; }
inline Cx Load(const double* p) { return {_mm_loadu_pd(p)}; }
inline void Store(double* p, Cx a) { _mm_storeu_pd(p, a.v); }
inline Cx operator+(Cx a, Cx b) { return {_mm_add_pd(a.v, b.v)}; }
inline Cx operator-(Cx a, Cx b) { return {_mm_sub_pd(a.v, b.v)}; }
inline Cx Scale(Cx a, double s) { return {_mm_mul_pd(a.v, _mm_set1_pd(s))}; }
inline Cx Conj(Cx a) { return {_mm_xor_pd(a.v, _mm_set_pd(-0.0, 0.0))}; }
// (re, im) -> (im, re).
inline Cx Swap(Cx a) { return {_mm_shuffle_pd(a.v, a.v, 1)}; }
// (re, im) -> (-im, re).
inline Cx TimesI(Cx a) { return {_mm_xor_pd(Swap(a).v, _mm_set_pd(0.0, -0.0))}; }
inline Cx Mul(Cx a, Cx w) {
  const __m128d re = _mm_mul_pd(a.v, _mm_unpacklo_pd(w.v, w.v));
  const __m128d im = _mm_mul_pd(TimesI(a).v, _mm_unpackhi_pd(w.v, w.v));
  return {_mm_add_pd(re, im)};
}

#elif defined(__ARM_NEON) && defined(__aarch64__)

struct Cx {
  float64x2_t v;
};
inline Cx MakeCx(double re, double im) { return {float64x2_t{re, im}}; }
inline Cx Load(const double* p) { return {vld1q_f64(p)}; }
inline void Store(double* p, Cx a) { vst1q_f64(p, a.v); }
inline Cx operator+(Cx a, Cx b) { return {vaddq_f64(a.v, b.v)}; }
inline Cx operator-(Cx a, Cx b) { return {vsubq_f64(a.v, b.v)}; }
inline Cx Scale(Cx a, double s) { return {vmulq_n_f64(a.v, s)}; }
inline Cx Conj(Cx a) { return {vmulq_f64(a.v, float64x2_t{1.0, -1.0})}; }
inline Cx Swap(Cx a) { return {vextq_f64(a.v, a.v, 1)}; }
inline Cx TimesI(Cx a) { return {vmulq_f64(Swap(a).v, float64x2_t{-1.0, 1.0})}; }
inline Cx Mul(Cx a, Cx w) {
  const float64x2_t re = vmulq_laneq_f64(a.v, w.v, 0);
  const float64x2_t im = vmulq_laneq_f64(TimesI(a).v, w.v, 1);
  return {vaddq_f64(re, im)};
}

#else

struct Cx {
  double re;
  double im;
};
inline Cx MakeCx(double re, double im) { return {re, im}; }
inline Cx Load(const double* p) { return {p[0], p[1]}; }
inline void Store(double* p, Cx a) {
  p[0] = a.re;
  p[1] = a.im;
}
inline Cx operator+(Cx a, Cx b) { return {a.re + b.re, a.im + b.im}; }
inline Cx operator-(Cx a, Cx b) { return {a.re - b.re, a.im - b.im}; }
inline Cx Scale(Cx a, double s) { return {a.re * s, a.im * s}; }
inline Cx Conj(Cx a) { return {a.re, -a.im}; }
inline Cx Swap(Cx a) { return {a.im, a.re}; }
inline Cx TimesI(Cx a) { return {-a.im, a.re}; }
inline Cx Mul(Cx a, Cx w) {
  return {a.re * w.re - a.im * w.im, a.im * w.re + a.re * w.im};
}

#endif

}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_COMPLEX_OPS_H_
