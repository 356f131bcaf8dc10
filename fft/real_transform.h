// The real FFT of real_fft.h over tables that are already built, for a
// given two-lane type V and, for the radix-4 passes, a type W of one or two
// V (Double4 where AVX runs). Every choice gives the same bits.
#ifndef CLIPWEAVER_FFT_REAL_TRANSFORM_H_
#define CLIPWEAVER_FFT_REAL_TRANSFORM_H_

#include <cstddef>
#include <type_traits>

#include "fft/complex_fft.h"
#include "fft/complex_ops.h"
#include "fft/twiddles.h"

namespace fft_internal {
inline namespace CLIPWEAVER_ISA {

// The split step on bins paired lane by lane: low holds X[k] of the n/2
// complex points, high X[n/2 - k]; the weight is (wr, wi), conjugated
// backward.
template <typename V, bool kBackward>
inline void SplitBins(Complex2<V>* low, Complex2<V>* high, V wr, V wi) {
  const V xr = low->re - high->re;
  const V xi = low->im + high->im;
  const V yr = kBackward ? wr * xr + wi * xi : wr * xr - wi * xi;
  const V yi = kBackward ? wr * xi - wi * xr : wr * xi + wi * xr;
  low->re = low->re - yr;
  low->im = low->im - yi;
  high->re = high->re + yr;
  high->im = high->im - yi;
}

// The last stage of the complex transform for elements k and h - k of the
// lane layout (0 < k <= h/2), held in xk and xm; their real parts were at x
// and y, imaginary parts `im` doubles on. With w^k = (wr, wi) it yields X[k]
// and X[h - k], which take the places of the real parts, and X[h + k] and
// X[2h - k], which take those of the imaginary parts: w^(h - k) = -conj(w^k)
// is why the second lane of wr is negated. Forward, the split step follows
// on the pairs (k, 2h - k) and (h - k, h + k) with the weights of bins k and
// h - k as c_km = (ck, cm) and c_mk = (cm, ck); backward, the output is
// conjugated. Returns what goes to x, y, x + im and y + im.
template <typename V>
struct CombinedGroup {
  V at_x, at_y, at_x_im, at_y_im;
};
template <typename V, bool kForward>
inline CombinedGroup<V> CombineGroup(Complex2<V> xk, Complex2<V> xm, V wr, V wi, V c_km, V c_mk) {
  const Complex2<V> even = {UnpackLow(xk.re, xm.re), UnpackLow(xk.im, xm.im)};
  const Complex2<V> odd = {UnpackHigh(xk.re, xm.re), UnpackHigh(xk.im, xm.im)};
  const Complex2<V> t = Mul(odd, wr, wi);
  Complex2<V> low = even + t;
  Complex2<V> high = even - t;
  if (kForward) {
    high = {Swap(high.re), Swap(high.im)};
    SplitBins<V, false>(&low, &high, Splat<V>(0.5) - c_mk, c_km);
    return {UnpackLow(low.re, low.im), UnpackHigh(low.re, low.im), UnpackHigh(high.re, high.im),
            UnpackLow(high.re, high.im)};
  }
  low.im = Neg(low.im);
  high.im = Neg(high.im);
  return {UnpackLow(low.re, low.im), UnpackHigh(low.re, low.im), UnpackLow(high.re, high.im),
          UnpackHigh(high.re, high.im)};
}

// Two groups side by side in W, in xk and xm as CombineGroup takes them,
// with their twiddles and weights c_km one per half. Their places px and py
// hold them in that order (+) or with the halves exchanged (-).
template <typename W, bool kForward, int kXDirection, int kYDirection>
inline void CombinePairOf(double* px, double* py, std::ptrdiff_t im, Complex2<W> xk,
                          Complex2<W> xm, W wr, W wi, W c_km) {
  const auto in_order = [](W v, int direction) { return direction > 0 ? v : SwapHalves(v); };
  const CombinedGroup<W> out = CombineGroup<W, kForward>(xk, xm, wr, wi, c_km, Swap(c_km));
  Store(px, in_order(out.at_x, kXDirection));
  Store(py, in_order(out.at_y, kYDirection));
  Store(px + im, in_order(out.at_x_im, kXDirection));
  Store(py + im, in_order(out.at_y_im, kYDirection));
}

// Groups k and k + 1 side by side in W, for the places x and y of group k;
// the places of group k + 1 lie above (+) or below (-) them.
template <typename W, bool kForward, int kXDirection, int kYDirection>
inline void CombinePair(double* x, double* y, std::ptrdiff_t im, W wr, W wi, W c_km) {
  double* const px = kXDirection > 0 ? x : x - 2;
  double* const py = kYDirection > 0 ? y : y - 2;
  const auto get = [&](double* p, int direction) {
    const Complex2<W> v = Get<W>(p, im);
    return direction > 0 ? v : Complex2<W>{SwapHalves(v.re), SwapHalves(v.im)};
  };
  CombinePairOf<W, kForward, kXDirection, kYDirection>(px, py, im, get(px, kXDirection),
                                                       get(py, kYDirection), wr, wi, c_km);
}

// One group of Combine on its own: the places x and y, w^k = (wr, wi)
// with the second lane of wr negated, and the pair of split weights at
// `weights`.
template <typename V, bool kForward>
inline void CombineOne(double* x, double* y, std::ptrdiff_t im, V wr, V wi, const double* weights) {
  const V c_km = Load<V>(weights);
  const CombinedGroup<V> out =
      CombineGroup<V, kForward>(Get<V>(x, im), Get<V>(y, im), wr, wi, c_km, Swap(c_km));
  Store(x, out.at_x);
  Store(y, out.at_y);
  Store(x + im, out.at_x_im);
  Store(y + im, out.at_y_im);
}

// The groups k, h - k, h/2 - k and h/2 + k of Combine, twiddle w = w^k.
template <typename V, bool kForward>
inline void CombineFour(double* a, int h, std::ptrdiff_t k, V w, const double* c, int nc,
                        std::ptrdiff_t step) {
  const std::ptrdiff_t im = 2 * h, kk = k * step;
  const V negated = Neg(w);
  CombineOne<V, kForward>(a + 2 * k, a + im - 2 * k, im, UnpackLow(w, negated), DupHigh(w),
                          c + 2 * kk);
  CombineOne<V, kForward>(a + h - 2 * k, a + h + 2 * k, im, UnpackHigh(w, negated), DupLow(w),
                          c + nc - 2 * kk);
}

// Combine's element 0 and the groups h/4 and h/2, which pair with
// themselves or take fixed twiddles.
template <typename V, bool kForward>
inline void CombineFixed(double* a, int h, const double* c, int nc) {
  const std::ptrdiff_t im = 2 * h;
  // Element 0 gives X[0] = E[0] + O[0] and X[h] = E[0] - O[0].
  const V sign = Make<V>(1, kForward ? 1 : -1);
  const V re = Load<V>(a), im0 = Load<V>(a + im);
  const V even = UnpackLow(re, im0), odd = UnpackHigh(re, im0);
  Store(a, (even + odd) * sign);
  Store(a + im, (even - odd) * sign);
  if (h >= 4) {
    const V c4 = Splat<V>(kC4);
    CombineOne<V, kForward>(a + h / 2, a + im - h / 2, im, c4 * Make<V>(1, -1), c4, c + nc / 2);
  }
  CombineOne<V, kForward>(a + h, a + h, im, Make<V>(0, -0.0), Splat<V>(1), c);
}

// Last complex stage over the whole lane layout, back to (re, im) pairs in
// natural order: element 0 alone, then the groups k and h/2 - k for each
// twiddle, then the two groups that pair with themselves. tw is the
// sub-table for the complex length 2h; the split weights are (1 - sin)/2
// and cos/2 of pi k / (2h), from the cosine region c of nc entries, and
// those of bins k and h - k share their entries.
template <typename V, typename W, bool kForward>
void Combine(int n, double* a, const double* tw, const double* c, int nc) {
  const int h = n >> 2;
  const std::ptrdiff_t im = 2 * h;
  const std::ptrdiff_t step = nc / h;
  CombineFixed<V, kForward>(a, h, c, nc);
  // Group h/2 - k takes w^(h/2 - k) = i conj(w^k). With W wider than V,
  // groups k and k + 1 run together for odd k.
  struct Twiddles {
    std::ptrdiff_t k;
    V w;
  };
  Twiddles pending{0, Splat<V>(0)};
  // The places and split weights of group k0 = pending.k, moved on by
  // each pair: worked out from k0 every time, they cost more than the
  // butterflies.
  double* up = a + 2;
  double* down = a + im - 2;
  double* mid_down = a + h - 2;
  double* mid_up = a + h + 2;
  const double* weights_up = c + 2 * step;
  const double* weights_mid = c + nc - 2 * step;
  ForEachTwiddle<V>(2 * h, tw, [&](std::ptrdiff_t k, V w, V) {
    if constexpr (!std::is_same_v<V, W>) {
      if (k % 2) {
        pending = {k, w};
        return;
      }
      pending.k = 0;
      const W both = Join(pending.w, w), negated = Neg(both);
      CombinePair<W, kForward, 1, -1>(
          up, down, im, UnpackLow(both, negated), DupHigh(both),
          Join(Load<V>(weights_up), Load<V>(weights_up + 2 * step)));
      CombinePair<W, kForward, -1, 1>(
          mid_down, mid_up, im, UnpackHigh(both, negated), DupLow(both),
          Join(Load<V>(weights_mid), Load<V>(weights_mid - 2 * step)));
      up += 4;
      down -= 4;
      mid_down -= 4;
      mid_up += 4;
      weights_up += 4 * step;
      weights_mid -= 4 * step;
      return;
    }
    CombineFour<V, kForward>(a, h, k, w, c, nc, step);
  });
  if (pending.k) CombineFour<V, kForward>(a, h, pending.k, pending.w, c, nc, step);
}

// The last radix-4 pass (length h, one butterfly a column) and Combine in
// one sweep, for a W of two V and 64 <= h <= 1024, with the arithmetic of both.
// With q = h/4, the columns c and q - c of the pass give the elements that
// Combine takes for its groups c and q - c, with their mates. So the
// columns (c, c + 1) for odd c and their mirrors (q - c - 1, q - c) go from
// the butterflies to Combine's groups c, c + 1, q - c - 1 and q - c without
// a round through memory. The columns 0 and q/2 - 1 .. q/2 + 1 and their
// groups are left over and done one at a time. n is a constant, kN: with
// every offset known, the pointers no longer take registers from the
// butterflies.
template <typename V, typename W, bool kForward, int kN>
void LastPassAndCombine(double* a, const double* w_end, int nc) {
  constexpr int n = kN, h = n >> 2, q = h >> 2;
  const std::ptrdiff_t im = 2 * h, s = h / 2, step = nc / h;
  const double* const t = w_end - h / 2;
  const double* const tw = w_end - h;
  const double* const c = w_end;
  // The mirrors are read with the halves exchanged, which puts them in
  // the order of their twiddles and of Combine's groups.
  const auto column_pair = [&](double* p, bool exchange, auto turn2, auto turn1, auto turn3) {
    const auto get = [&](double* at) {
      const Complex2<W> v = Get<W>(at, im);
      return exchange ? Complex2<W>{SwapHalves(v.re), SwapHalves(v.im)} : v;
    };
    return Radix4Values<W>(get(p), get(p + s), get(p + 2 * s), get(p + 3 * s), turn2, turn1,
                           turn3);
  };
  // Twiddles as ForEachTwiddle makes them: odd k from the even ones on
  // either side, the pass's upwards from k = 1 and Combine's both ways.
  const V odd1 = Splat<V>(t[2]), odd3 = Splat<V>(t[3]), odd_w = Splat<V>(tw[2]);
  V below1 = Make<V>(1, 0), below3 = below1, below_w = below1;
  V above_w = Splat<V>(tw[1]);
  for (int k = 1; k + 3 <= q / 2; k += 2) {
    const V even1 = Load<V>(t + 2 * k + 2), even3 = Load<V>(t + 2 * k + 4);
    const V w1 = (below1 + even1) * odd1, w3 = (below3 + even3) * odd3;
    below1 = even1;
    below3 = even3;
    // Columns k, k + 1 at x and their mirrors q - k - 1, q - k at y.
    double* const x = a + 2 * k;
    double* const y = a + s - 2 * k - 2;
    const W both1 = Join(w1, even1), both3 = Join(w3, even3);
    const W c1 = DupLow(both1), s1 = DupHigh(both1), c3 = DupLow(both3), s3 = DupHigh(both3);
    W c2, s2;
    SquareParts(c1, s1, &c2, &s2);
    // low holds the columns k, k + 1 and high the mirrors q - k, q - k - 1.
    const Quarters<W> low =
        column_pair(x, false, Turn<W>{c2, s2}, Turn<W>{c1, s1}, TurnConj<W>{c3, s3});
    const Quarters<W> high =
        column_pair(y, true, Turn<W>{Neg(c2), s2}, Turn<W>{s1, c1}, TurnConj<W>{s3, c3});
    const V even_w = Load<V>(tw + 2 * k + 2);
    const V w = (below_w + even_w) * odd_w;
    below_w = even_w;
    {
      // Combine's groups k, k + 1.
      const W both = Join(w, even_w), negated = Neg(both);
      const std::ptrdiff_t kk = k * step;
      CombinePairOf<W, kForward, 1, -1>(x, y + 3 * s, im, low.x[0], high.x[3],
                                        UnpackLow(both, negated), DupHigh(both),
                                        Join(Load<V>(c + 2 * kk), Load<V>(c + 2 * (kk + step))));
      CombinePairOf<W, kForward, -1, 1>(
          y + s, x + 2 * s, im, high.x[1], low.x[2], UnpackHigh(both, negated), DupLow(both),
          Join(Load<V>(c + nc - 2 * kk), Load<V>(c + nc - 2 * (kk + step))));
    }
    // Combine's groups q - k (odd) and q - k - 1 (even).
    const V mirror_even = Load<V>(tw + 2 * (q - k - 1));
    const V mirror_odd = (mirror_even + above_w) * odd_w;
    above_w = mirror_even;
    {
      const W both = Join(mirror_odd, mirror_even), negated = Neg(both);
      const std::ptrdiff_t kk = (q - k) * step;
      CombinePairOf<W, kForward, -1, 1>(y, x + 3 * s, im, high.x[0], low.x[3],
                                        UnpackLow(both, negated), DupHigh(both),
                                        Join(Load<V>(c + 2 * kk), Load<V>(c + 2 * (kk - step))));
      CombinePairOf<W, kForward, 1, -1>(
          x + s, y + 2 * s, im, low.x[1], high.x[2], UnpackHigh(both, negated), DupLow(both),
          Join(Load<V>(c + nc - 2 * kk), Load<V>(c + nc - 2 * (kk - step))));
    }
  }
  // The columns left over, one lane pair each: 0, q/2 and the pair
  // q/2 - 1, q/2 + 1 of one twiddle.
  const int last = q / 2 - 1;
  {
    V w1, w3;
    TwiddleAt<V>(h, t, last, &w1, &w3);
    Radix4<V>(a, s, im, Unturned(), Unturned(), Unturned());
    Radix4<V>(a + 2 * (q / 2), s, im, TurnI(), TurnEighth(), TurnThreeEighths());
    ColumnTurns(w1, w3, false, [&](auto t2, auto t1, auto t3) {
      Radix4<V>(a + 2 * last, s, im, t2, t1, t3);
    });
    ColumnTurns(w1, w3, true, [&](auto t2, auto t1, auto t3) {
      Radix4<V>(a + 2 * (q - last), s, im, t2, t1, t3);
    });
  }
  CombineFixed<V, kForward>(a, h, c, nc);
  for (int k = last; k <= q / 2 + 1; ++k) {
    V w, unused;
    TwiddleAt<V>(2 * h, tw, k, &w, &unused);
    CombineFour<V, kForward>(a, h, k, w, c, nc, step);
  }
}

// Backward split step, in place on the packed spectrum, on the same groups
// of bins as Combine (k = h/2 pairs with itself in both lanes).
template <typename V>
void SplitBackward(int n, double* a, const double* c, int nc) {
  const int h = n >> 2;
  const std::ptrdiff_t im = 2 * h;
  const std::ptrdiff_t step = nc / h;
  for (std::ptrdiff_t k = 1; k <= h / 2; ++k) {
    double* const x = a + 2 * k;
    double* const y = a + im - 2 * k;
    const V xk = Load<V>(x), xm = Load<V>(y), yk = Load<V>(y + im), ym = Load<V>(x + im);
    Complex2<V> low = {UnpackLow(xk, xm), UnpackHigh(xk, xm)};
    Complex2<V> high = {UnpackLow(yk, ym), UnpackHigh(yk, ym)};
    // Bin h/2 takes the pair kept at the start.
    const V c_km = Load<V>(2 * k == h ? c : c + 2 * k * step);
    SplitBins<V, true>(&low, &high, Splat<V>(0.5) - Swap(c_km), c_km);
    Store(x, UnpackLow(low.re, low.im));
    Store(y, UnpackHigh(low.re, low.im));
    Store(y + im, UnpackLow(high.re, high.im));
    Store(x + im, UnpackHigh(high.re, high.im));
  }
}

// The whole complex stage for n >= 8, unscaled, exp(+...) forward and
// exp(-...) backward.
template <typename V, typename W, bool kForward>
void ComplexStage(int n, double* data, const double* w_end, int nc) {
  if constexpr (!std::is_same_v<V, W>) {
    // Up to the 4096 points of 96 kHz input the sweep, with its constant
    // offsets, beats the two passes apart; longer lengths keep those.
    if (n >= 256 && n <= 4096) {
      LaneTransform<V, W, !kForward, false>(n, data, w_end);
      switch (n) {
        case 256:
          return LastPassAndCombine<V, W, kForward, 256>(data, w_end, nc);
        case 512:
          return LastPassAndCombine<V, W, kForward, 512>(data, w_end, nc);
        case 1024:
          return LastPassAndCombine<V, W, kForward, 1024>(data, w_end, nc);
        case 2048:
          return LastPassAndCombine<V, W, kForward, 2048>(data, w_end, nc);
        default:
          return LastPassAndCombine<V, W, kForward, 4096>(data, w_end, nc);
      }
    }
  }
  LaneTransform<V, W, !kForward>(n, data, w_end);
  Combine<V, W, kForward>(n, data, w_end - (n >> 2), w_end, nc);
}

// The complex stage for n = 4, the same both ways.
inline void TwoPoints(double* data) {
  const double re = data[0] - data[2], im = data[1] - data[3];
  data[0] += data[2];
  data[1] += data[3];
  data[2] = re;
  data[3] = im;
}

template <typename V, typename W = V>
void RealTransform(int n, int direction, double* data, const int* bit_reversal_work,
                   const double* twiddle_table) {
  const double* w_end = twiddle_table + bit_reversal_work[0];
  const int nc = bit_reversal_work[1];
  if (direction >= 0) {
    if (n >= 8) {
      ComplexStage<V, W, true>(n, data, w_end, nc);
    } else if (n == 4) {
      TwoPoints(data);
    }
    const double difference = data[0] - data[1];
    data[0] += data[1];
    data[1] = difference;
  } else {
    data[1] = 0.5 * (data[0] - data[1]);
    data[0] -= data[1];
    if (n >= 8) {
      SplitBackward<V>(n, data, w_end, nc);
      ComplexStage<V, W, false>(n, data, w_end, nc);
    } else if (n == 4) {
      TwoPoints(data);
    }
  }
}

}  // namespace CLIPWEAVER_ISA
}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_REAL_TRANSFORM_H_
