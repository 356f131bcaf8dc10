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

// Groups k and k + 1 side by side in W, for the places x and y of group k;
// the places of group k + 1 lie above (+) or below (-) them. The twiddles
// and the weights c_km come as W already, one group per half.
template <typename W, bool kForward, int kXDirection, int kYDirection>
inline void CombinePair(double* x, double* y, std::ptrdiff_t im, W wr, W wi, W c_km) {
  double* const px = kXDirection > 0 ? x : x - 2;
  double* const py = kYDirection > 0 ? y : y - 2;
  const auto in_order = [](W v, int direction) { return direction > 0 ? v : SwapHalves(v); };
  const Complex2<W> xk = {in_order(Load<W>(px), kXDirection), in_order(Load<W>(px + im), kXDirection)};
  const Complex2<W> xm = {in_order(Load<W>(py), kYDirection), in_order(Load<W>(py + im), kYDirection)};
  const CombinedGroup<W> out = CombineGroup<W, kForward>(xk, xm, wr, wi, c_km, Swap(c_km));
  Store(px, in_order(out.at_x, kXDirection));
  Store(py, in_order(out.at_y, kYDirection));
  Store(px + im, in_order(out.at_x_im, kXDirection));
  Store(py + im, in_order(out.at_y_im, kYDirection));
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
  const double* const c_end = c + nc;
  const double* const c_half = c + nc / 2;
  auto group = [&](double* x, double* y, V wr, V wi, const double* ck, const double* cm) {
    const CombinedGroup<V> out = CombineGroup<V, kForward>(Get<V>(x, im), Get<V>(y, im), wr, wi,
                                                           Make<V>(*ck, *cm), Make<V>(*cm, *ck));
    Store(x, out.at_x);
    Store(y, out.at_y);
    Store(x + im, out.at_x_im);
    Store(y + im, out.at_y_im);
  };
  // Element 0 gives X[0] = E[0] + O[0] and X[h] = E[0] - O[0].
  const V sign = Make<V>(1, kForward ? 1 : -1);
  const V re = Load<V>(a), im0 = Load<V>(a + im);
  const V even = UnpackLow(re, im0), odd = UnpackHigh(re, im0);
  Store(a, (even + odd) * sign);
  Store(a + im, (even - odd) * sign);
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
  const double* c_up = c + step;
  const double* c_down = c_end - step;
  const double* half_down = c_half - step;
  const double* half_up = c_half + step;
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
          Join(Make<V>(c_up[0], c_down[0]), Make<V>(c_up[step], c_down[-step])));
      CombinePair<W, kForward, -1, 1>(
          mid_down, mid_up, im, UnpackHigh(both, negated), DupLow(both),
          Join(Make<V>(half_down[0], half_up[0]), Make<V>(half_down[-step], half_up[step])));
      up += 4;
      down -= 4;
      mid_down -= 4;
      mid_up += 4;
      c_up += 2 * step;
      c_down -= 2 * step;
      half_down -= 2 * step;
      half_up += 2 * step;
      return;
    }
    const V negated = Neg(w);
    const std::ptrdiff_t kk = k * step;
    group(a + 2 * k, a + im - 2 * k, UnpackLow(w, negated), DupHigh(w), c + kk, c_end - kk);
    group(a + h - 2 * k, a + h + 2 * k, UnpackHigh(w, negated), DupLow(w), c_half - kk,
          c_half + kk);
  });
  if (pending.k) {
    const std::ptrdiff_t k = pending.k, kk = k * step;
    const V w = pending.w, negated = Neg(w);
    group(a + 2 * k, a + im - 2 * k, UnpackLow(w, negated), DupHigh(w), c + kk, c_end - kk);
    group(a + h - 2 * k, a + h + 2 * k, UnpackHigh(w, negated), DupLow(w), c_half - kk,
          c_half + kk);
  }
  if (h >= 4) {
    const V c4 = Splat<V>(kC4);
    group(a + h / 2, a + im - h / 2, c4 * Make<V>(1, -1), c4, c + nc / 4, c_end - nc / 4);
  }
  group(a + h, a + h, Make<V>(0, -0.0), Splat<V>(1), c_half, c_half);
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
    const double* const ck = c + k * step;
    const double* const cm = c + nc - k * step;
    SplitBins<V, true>(&low, &high, Splat<V>(0.5) - Make<V>(*cm, *ck), Make<V>(*ck, *cm));
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
