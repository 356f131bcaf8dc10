// Two doubles as one value, held in a 128-bit register where the target has
// one. Every operation is the correctly rounded IEEE operation lane by lane
// or an exact move (no fused multiply-add), so the SSE2, NEON and plain
// versions give the same bits. The plain version exists on every target, so
// that tests can run a kernel with both and compare.
#ifndef CLIPWEAVER_FFT_COMPLEX_OPS_H_
#define CLIPWEAVER_FFT_COMPLEX_OPS_H_

#include "base/instruction_set.h"

#if defined(CLIPWEAVER_SSE2)
#include <emmintrin.h>
#elif defined(CLIPWEAVER_NEON)
#include <arm_neon.h>
#endif

namespace fft_internal {
inline namespace CLIPWEAVER_ISA {

template <typename V>
V Load(const double* p);
template <typename V>
V Make(double lo, double hi);
template <typename V>
V Splat(double a) {
  return Make<V>(a, a);
}

struct PlainDouble2 {
  double lo;
  double hi;
};
template <>
inline PlainDouble2 Load<PlainDouble2>(const double* p) {
  return {p[0], p[1]};
}
template <>
inline PlainDouble2 Make<PlainDouble2>(double lo, double hi) {
  return {lo, hi};
}
inline void Store(double* p, PlainDouble2 a) {
  p[0] = a.lo;
  p[1] = a.hi;
}
inline PlainDouble2 operator+(PlainDouble2 a, PlainDouble2 b) { return {a.lo + b.lo, a.hi + b.hi}; }
inline PlainDouble2 operator-(PlainDouble2 a, PlainDouble2 b) { return {a.lo - b.lo, a.hi - b.hi}; }
inline PlainDouble2 operator*(PlainDouble2 a, PlainDouble2 b) { return {a.lo * b.lo, a.hi * b.hi}; }
inline PlainDouble2 Neg(PlainDouble2 a) { return {-a.lo, -a.hi}; }
inline PlainDouble2 Swap(PlainDouble2 a) { return {a.hi, a.lo}; }
inline PlainDouble2 DupLow(PlainDouble2 a) { return {a.lo, a.lo}; }
inline PlainDouble2 DupHigh(PlainDouble2 a) { return {a.hi, a.hi}; }
// (a.lo, b.lo) and (a.hi, b.hi).
inline PlainDouble2 UnpackLow(PlainDouble2 a, PlainDouble2 b) { return {a.lo, b.lo}; }
inline PlainDouble2 UnpackHigh(PlainDouble2 a, PlainDouble2 b) { return {a.hi, b.hi}; }

#if defined(CLIPWEAVER_SSE2)

struct Double2 {
  __m128d v;
};
// Vector loads are what these kernels run short of first. The empty asm
// keeps the compiler from folding a load into two half loads or reading
// memory again in place of a register copy.
template <>
inline Double2 Load<Double2>(const double* p) {
  __m128d v = _mm_loadu_pd(p);
#if defined(__GNUC__)
  __asm__("" : "+x"(v));
#endif
  return {v};
}
template <>
inline Double2 Make<Double2>(double lo, double hi) {
  return {_mm_set_pd(hi, lo)};
}
inline void Store(double* p, Double2 a) { _mm_storeu_pd(p, a.v); }
inline Double2 operator+(Double2 a, Double2 b) { return {_mm_add_pd(a.v, b.v)}; }
inline Double2 operator-(Double2 a, Double2 b) { return {_mm_sub_pd(a.v, b.v)}; }
inline Double2 operator*(Double2 a, Double2 b) { return {_mm_mul_pd(a.v, b.v)}; }
inline Double2 Neg(Double2 a) { return {_mm_xor_pd(a.v, _mm_set1_pd(-0.0))}; }
inline Double2 Swap(Double2 a) { return {_mm_shuffle_pd(a.v, a.v, 1)}; }
inline Double2 DupLow(Double2 a) { return {_mm_unpacklo_pd(a.v, a.v)}; }
inline Double2 DupHigh(Double2 a) { return {_mm_unpackhi_pd(a.v, a.v)}; }
inline Double2 UnpackLow(Double2 a, Double2 b) { return {_mm_unpacklo_pd(a.v, b.v)}; }
inline Double2 UnpackHigh(Double2 a, Double2 b) { return {_mm_unpackhi_pd(a.v, b.v)}; }

#elif defined(CLIPWEAVER_NEON)

struct Double2 {
  float64x2_t v;
};
template <>
inline Double2 Load<Double2>(const double* p) {
  return {vld1q_f64(p)};
}
template <>
inline Double2 Make<Double2>(double lo, double hi) {
  return {float64x2_t{lo, hi}};
}
inline void Store(double* p, Double2 a) { vst1q_f64(p, a.v); }
inline Double2 operator+(Double2 a, Double2 b) { return {vaddq_f64(a.v, b.v)}; }
inline Double2 operator-(Double2 a, Double2 b) { return {vsubq_f64(a.v, b.v)}; }
inline Double2 operator*(Double2 a, Double2 b) { return {vmulq_f64(a.v, b.v)}; }
inline Double2 Neg(Double2 a) { return {vnegq_f64(a.v)}; }
inline Double2 Swap(Double2 a) { return {vextq_f64(a.v, a.v, 1)}; }
inline Double2 DupLow(Double2 a) { return {vdupq_laneq_f64(a.v, 0)}; }
inline Double2 DupHigh(Double2 a) { return {vdupq_laneq_f64(a.v, 1)}; }
inline Double2 UnpackLow(Double2 a, Double2 b) { return {vzip1q_f64(a.v, b.v)}; }
inline Double2 UnpackHigh(Double2 a, Double2 b) { return {vzip2q_f64(a.v, b.v)}; }

#else

using Double2 = PlainDouble2;

#endif

// Two complex numbers, one per lane.
template <typename V>
struct Complex2 {
  V re;
  V im;
};
template <typename V>
inline Complex2<V> operator+(Complex2<V> a, Complex2<V> b) {
  return {a.re + b.re, a.im + b.im};
}
template <typename V>
inline Complex2<V> operator-(Complex2<V> a, Complex2<V> b) {
  return {a.re - b.re, a.im - b.im};
}
// a + ib and a - ib.
template <typename V>
inline Complex2<V> PlusI(Complex2<V> a, Complex2<V> b) {
  return {a.re - b.im, a.im + b.re};
}
template <typename V>
inline Complex2<V> MinusI(Complex2<V> a, Complex2<V> b) {
  return {a.re + b.im, a.im - b.re};
}
// x w and x conj(w), w = wr + i wi.
template <typename V>
inline Complex2<V> Mul(Complex2<V> x, V wr, V wi) {
  return {x.re * wr - x.im * wi, x.re * wi + x.im * wr};
}
template <typename V>
inline Complex2<V> MulConj(Complex2<V> x, V wr, V wi) {
  return {x.re * wr + x.im * wi, x.im * wr - x.re * wi};
}

}  // namespace CLIPWEAVER_ISA
}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_COMPLEX_OPS_H_
