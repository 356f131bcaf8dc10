// Reading the twiddles of one complex length L out of its sub-table (layout in
// fft_tables.h), and the few that short kernels take as constants.
#ifndef CLIPWEAVER_FFT_TWIDDLES_H_
#define CLIPWEAVER_FFT_TWIDDLES_H_

#include "fft/complex_ops.h"

namespace fft_internal {
inline namespace CLIPWEAVER_ISA {

// cos(pi/4), cos(pi/8), sin(pi/8).
constexpr double kC4 = 0.7071067811865476;
constexpr double kC8 = 0.9238795325112867;
constexpr double kS8 = 0.3826834323650898;

// Calls f(k, w1, w3) for 0 < k < L/8 in increasing order, where with
// w = exp(2 pi i / L), w1 = (re, im) of w^k and w3 = (re, im) of
// conj(w^3k), both as (lo, hi) of a V. The rest of the circle follows by
// symmetry. t is the sub-table for L; odd k are midpoints of even ones.
template <typename V, typename F>
inline void ForEachTwiddle(int length, const double* t, F f) {
  if (length == 16) {
    f(1, Load<V>(t + 2), Make<V>(t[3], -t[2]));
    return;
  }
  if (length < 32) return;
  const V odd1 = Splat<V>(t[2]);
  const V odd3 = Splat<V>(t[3]);
  V w1 = Make<V>(1, 0);
  V w3 = w1;
  int j = 4;
  for (; j < length / 4; j += 4) {
    const V next1 = Load<V>(t + j);
    const V next3 = Load<V>(t + j + 2);
    f(j / 2 - 1, (w1 + next1) * odd1, (w3 + next3) * odd3);
    f(j / 2, next1, next3);
    w1 = next1;
    w3 = next3;
  }
  f(j / 2 - 1, (w1 + Splat<V>(t[1])) * odd1, (w3 + Splat<V>(-t[1])) * odd3);
}

// The w1 and w3 that ForEachTwiddle gives for one k, worked out the same
// way; length >= 32.
template <typename V>
inline void TwiddleAt(int length, const double* t, int k, V* w1, V* w3) {
  if (k % 2 == 0) {
    *w1 = Load<V>(t + 2 * k);
    *w3 = Load<V>(t + 2 * k + 2);
    return;
  }
  const bool first = k == 1, last = k + 1 == length / 8;
  const V below1 = first ? Make<V>(1, 0) : Load<V>(t + 2 * k - 2);
  const V below3 = first ? Make<V>(1, 0) : Load<V>(t + 2 * k);
  const V above1 = last ? Splat<V>(t[1]) : Load<V>(t + 2 * k + 2);
  const V above3 = last ? Splat<V>(-t[1]) : Load<V>(t + 2 * k + 4);
  *w1 = (below1 + above1) * Splat<V>(t[2]);
  *w3 = (below3 + above3) * Splat<V>(t[3]);
}

// Turns: multiplications by a twiddle, as butterflies apply them to their inputs.
struct Unturned {
  template <typename V>
  Complex2<V> operator()(Complex2<V> x) const {
    return x;
  }
};
template <typename V>
struct Turn {
  Complex2<V> operator()(Complex2<V> x) const { return Mul(x, wr, wi); }
  V wr;
  V wi;
};
template <typename V>
struct TurnConj {
  Complex2<V> operator()(Complex2<V> x) const { return MulConj(x, wr, wi); }
  V wr;
  V wi;
};
// By exp(i pi/4) and exp(3i pi/4).
struct TurnEighth {
  template <typename V>
  Complex2<V> operator()(Complex2<V> x) const {
    return {(x.re - x.im) * Splat<V>(kC4), (x.re + x.im) * Splat<V>(kC4)};
  }
};
struct TurnThreeEighths {
  template <typename V>
  Complex2<V> operator()(Complex2<V> x) const {
    return {(x.re + x.im) * Splat<V>(-kC4), (x.re - x.im) * Splat<V>(kC4)};
  }
};

// Multiplying by i.
struct TurnI {
  template <typename V>
  Complex2<V> operator()(Complex2<V> x) const {
    return {Neg(x.im), x.re};
  }
};

// For a W of two V: `low` on the low half of each value and `high` on the
// high half.
template <typename TLow, typename THigh>
struct SplitTurn {
  template <typename W>
  Complex2<W> operator()(Complex2<W> x) const {
    const Complex2<W> l = low(x), h = high(x);
    return {HighFrom(l.re, h.re), HighFrom(l.im, h.im)};
  }
  TLow low;
  THigh high;
};
template <typename TLow, typename THigh>
SplitTurn<TLow, THigh> Split(TLow low, THigh high) {
  return {low, high};
}

// The real and imaginary parts of w^2 from those of w, each in both lanes.
template <typename V>
inline void SquareParts(V c, V s, V* c2, V* s2) {
  *c2 = c * c - s * s;
  const V product = c * s;
  *s2 = product + product;
}

}  // namespace CLIPWEAVER_ISA
}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_TWIDDLES_H_
