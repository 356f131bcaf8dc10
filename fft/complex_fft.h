// Complex stage of the real FFT, run as two half-length transforms side by
// side: the n/2 complex points (re, im pairs in a[0 .. n-1]) split into the
// even-numbered ones E and the odd-numbered ones O, and each V carries E in
// its low lane and O in its high lane, so both take the same twiddles and
// nothing crosses lanes until the last stage. The caller does that stage
// (X[k] = E[k] + w^k O[k]), merged with whatever it does next.
//
// Lane layout, h = n/4 elements: element c has its real parts (E, O) at
// a[2c], a[2c + 1] and its imaginary parts at a[n/2 + 2c], a[n/2 + 2c + 1].
// Elements k and h - k take the places of the output points k, h - k, h + k
// and 2h - k, which keeps the last stage in place.
#ifndef CLIPWEAVER_FFT_COMPLEX_FFT_H_
#define CLIPWEAVER_FFT_COMPLEX_FFT_H_

#include <cstddef>
#include <type_traits>

#include "fft/complex_ops.h"
#include "fft/twiddles.h"

namespace fft_internal {
inline namespace CLIPWEAVER_ISA {

// Element at p of a layout whose imaginary parts lie `im` doubles behind
// the real ones.
template <typename V>
inline Complex2<V> Get(const double* p, std::ptrdiff_t im) {
  return {Load<V>(p), Load<V>(p + im)};
}
template <typename V>
inline void Put(double* p, std::ptrdiff_t im, Complex2<V> x) {
  Store(p, x.re);
  Store(p + im, x.im);
}

struct ByteReversal {
  unsigned char of[256];
};
constexpr ByteReversal MakeByteReversal() {
  ByteReversal table{};
  for (int i = 0; i < 256; ++i) {
    for (int b = 0; b < 8; ++b) {
      if (i & (1 << b)) table.of[i] |= static_cast<unsigned char>(0x80 >> b);
    }
  }
  return table;
}
inline constexpr ByteReversal kByteReversal = MakeByteReversal();

// x of `bits` <= 16 bits, reversed.
inline int ReverseBits(int x, int bits) {
  const int r = (kByteReversal.of[x & 255] << 8) | kByteReversal.of[(x >> 8) & 255];
  return r >> (16 - bits);
}

// Calls pair(i, j) for every i whose bit reversal j over `bits` bits is a
// different number (once per pair), and self(i) for the others. An index is
// split into a high and a low digit of bits/2 bits and a middle bit when bits
// is odd; reversal swaps the high digit with the reversed low one, so the
// pairs come from digit pairs and need no test. Inlined by force: GCC
// would otherwise call it, and the pair and self passed to it too.
template <typename Pair, typename Self>
__attribute__((always_inline)) inline void ForEachReversal(int bits, Pair pair, Self self) {
  const int r = bits >> 1;
  const int middles = 1 << (bits & 1);
  const int high_unit = middles << r;
  // Looked up in the inner loop rather than worked out there again.
  int reversed[1 << 8];
  for (int x = 0; x < (1 << r); ++x) reversed[x] = ReverseBits(x, r);
  for (int x = 0; x < (1 << r); ++x) {
    const int reversed_x = reversed[x];
    for (int y = 0; y < x; ++y) {
      const int reversed_y = reversed[y];
      for (int m = 0; m < middles; ++m) {
        pair(x * high_unit + (m << r) + reversed_y, y * high_unit + (m << r) + reversed_x);
      }
    }
    for (int m = 0; m < middles; ++m) self(x * high_unit + (m << r) + reversed_x);
  }
}

// Elements e and e + h/2 from the input points 2e, 2e + 1, 2e + h and
// 2e + h + 1, after the first stage: their sum and difference.
template <typename V, bool kConj>
inline void ReadPair(const double* a, int h, int e, Complex2<V>* sum, Complex2<V>* difference) {
  const double* p = a + 4 * e;
  const V x0 = Load<V>(p), x1 = Load<V>(p + 2);
  const V y0 = Load<V>(p + 2 * h), y1 = Load<V>(p + 2 * h + 2);
  Complex2<V> first = {UnpackLow(x0, x1), UnpackHigh(x0, x1)};
  Complex2<V> second = {UnpackLow(y0, y1), UnpackHigh(y0, y1)};
  if (kConj) {
    first.im = Neg(first.im);
    second.im = Neg(second.im);
  }
  *sum = first + second;
  *difference = first - second;
}

// The same two elements as the halves of one W, from the input points at p
// = a + 4e and p + 2h: the sums and differences come first and are sorted
// into real and imaginary parts afterwards.
template <typename W>
inline Complex2<W> ReadJoinedPair(const double* p, int h) {
  const W x = Load<W>(p), y = Load<W>(p + 2 * h);
  const W sum = x + y, difference = x - y;
  const W low = LowHalves(sum, difference), high = HighHalves(sum, difference);
  return {UnpackLow(low, high), UnpackHigh(low, high)};
}

// Input points to lane layout in bit-reversed order, for decimation in time,
// with the first kStages stages (1 or 2) done on the way. Block t, the
// 2^kStages positions from 2^kStages t on, starts from element reverse(t):
// its position u holds element reverse(t) + reverse(u) h / 2^kStages. The
// blocks starting from elements 2^(kStages-1) g + r form group g, which
// reads exactly the places that group reverse(g) writes, so groups are
// worked out in pairs; two stages need a buffer for one group of the pair.
// kConj conjugates the input. Needs h >= 2^(2 kStages - 1). A wider W
// takes the forward stages two elements at a time.
template <typename V, typename W, bool kConj, int kStages>
void FirstStages(int n, double* a) {
  const int h = n >> 2;
  const std::ptrdiff_t im = 2 * h;
  int bits = 0;
  for (int m = h; m > 1; m >>= 1) ++bits;
  constexpr bool kJoined = !kConj && !std::is_same_v<V, W>;
  if constexpr (kStages == 1 && kJoined) {
    const auto read = [&](int e, W* re, W* im_parts) {
      const Complex2<W> x = ReadJoinedPair<W>(a + 4 * e, h);
      *re = x.re;
      *im_parts = x.im;
    };
    ForEachReversal(
        bits - 1,
        [&](int g, int partner) {
          W re, im_parts, partner_re, partner_im;
          read(g, &re, &im_parts);
          read(partner, &partner_re, &partner_im);
          Store(a + 4 * partner, re);
          Store(a + 4 * partner + im, im_parts);
          Store(a + 4 * g, partner_re);
          Store(a + 4 * g + im, partner_im);
        },
        [&](int g) {
          W re, im_parts;
          read(g, &re, &im_parts);
          Store(a + 4 * g, re);
          Store(a + 4 * g + im, im_parts);
        });
  } else if constexpr (kStages == 1) {
    // Group g is block reverse(g) = partner, at 4 partner.
    ForEachReversal(
        bits - 1,
        [&](int g, int partner) {
          Complex2<V> sum, difference, partner_sum, partner_difference;
          ReadPair<V, kConj>(a, h, g, &sum, &difference);
          ReadPair<V, kConj>(a, h, partner, &partner_sum, &partner_difference);
          Put(a + 4 * partner, im, sum);
          Put(a + 4 * partner + 2, im, difference);
          Put(a + 4 * g, im, partner_sum);
          Put(a + 4 * g + 2, im, partner_difference);
        },
        [&](int g) {
          Complex2<V> sum, difference;
          ReadPair<V, kConj>(a, h, g, &sum, &difference);
          Put(a + 4 * g, im, sum);
          Put(a + 4 * g + 2, im, difference);
        });
  } else {
    // Group g holds the blocks starting from elements 2g and 2g + 1, which
    // are blocks partner and partner + h/8, at 8 partner and 8 partner + h.
    // The second stage is radix 2 with twiddles 1 and i.
    constexpr std::ptrdiff_t kBufferIm = 16;
    double buffer[2 * kBufferIm];
    auto block = [&](int e, double* p, std::ptrdiff_t p_im) {
      if constexpr (kJoined) {
        // Elements e, e + h/2 and, turned by 1 and i, e + h/4, e + 3h/4:
        // both butterflies of the second stage at once.
        const Complex2<W> x = ReadJoinedPair<W>(a + 4 * e, h);
        const Complex2<W> y = Split(Unturned(), TurnI())(ReadJoinedPair<W>(a + 4 * e + h, h));
        Put(p, p_im, x + y);
        Put(p + 4, p_im, x - y);
      } else {
        Complex2<V> x0, x1, x2, x3;
        ReadPair<V, kConj>(a, h, e, &x0, &x1);
        ReadPair<V, kConj>(a, h, e + h / 4, &x2, &x3);
        Put(p, p_im, x0 + x2);
        Put(p + 2, p_im, PlusI(x1, x3));
        Put(p + 4, p_im, x0 - x2);
        Put(p + 6, p_im, MinusI(x1, x3));
      }
    };
    using U = std::conditional_t<kJoined, W, V>;
    auto unbuffer = [&](double* p) {
      for (int u = 0; u < 8; u += kJoined ? 4 : 2) {
        Put(p + u, im, Get<U>(buffer + u, kBufferIm));
        Put(p + h + u, im, Get<U>(buffer + 8 + u, kBufferIm));
      }
    };
    ForEachReversal(
        bits - 3,
        [&](int g, int partner) {
          block(2 * g, buffer, kBufferIm);
          block(2 * g + 1, buffer + 8, kBufferIm);
          block(2 * partner, a + 8 * g, im);
          block(2 * partner + 1, a + 8 * g + h, im);
          unbuffer(a + 8 * partner);
        },
        [&](int g) {
          block(2 * g, buffer, kBufferIm);
          block(2 * g + 1, buffer + 8, kBufferIm);
          unbuffer(a + 8 * g);
        });
  }
}

// Radix-4 butterfly of decimation in time on the quarters a, b, c, d of a
// block, which hold the transforms of the points 0, 2, 1 and 3 mod 4
// (bit-reversed order), each before its turn; returns the new quarters.
template <typename V>
struct Quarters {
  Complex2<V> x[4];
};
template <typename V, typename T2, typename T1, typename T3>
inline Quarters<V> Radix4Values(Complex2<V> a, Complex2<V> b, Complex2<V> c, Complex2<V> d,
                                T2 turn2, T1 turn1, T3 turn3) {
  b = turn2(b);
  c = turn1(c);
  d = turn3(d);
  const Complex2<V> t0 = a + b, t1 = a - b, u = c + d, v = c - d;
  return {{t0 + u, PlusI(t1, v), t0 - u, MinusI(t1, v)}};
}

// The same at element p of a block whose quarters are s doubles apart.
template <typename V, typename T2, typename T1, typename T3>
inline void Radix4(double* p, std::ptrdiff_t s, std::ptrdiff_t im, T2 turn2, T1 turn1, T3 turn3) {
  const Complex2<V> a = Get<V>(p, im);
  const Complex2<V> b = turn2(Get<V>(p + s, im));
  const Complex2<V> c = turn1(Get<V>(p + 2 * s, im));
  const Complex2<V> d = turn3(Get<V>(p + 3 * s, im));
  const Complex2<V> t0 = a + b, t1 = a - b, u = c + d, v = c - d;
  Put(p, im, t0 + u);
  Put(p + s, im, PlusI(t1, v));
  Put(p + 2 * s, im, t0 - u);
  Put(p + 3 * s, im, MinusI(t1, v));
}

// The butterflies at one index of every block, p running to end in steps.
template <typename V, typename T2, typename T1, typename T3>
inline void Radix4Column(double* p, const double* end, std::ptrdiff_t step, std::ptrdiff_t s,
                         std::ptrdiff_t im, T2 turn2, T1 turn1, T3 turn3) {
  for (; p < end; p += step) Radix4<V>(p, s, im, turn2, turn1, turn3);
}

// Calls f(turn2, turn1, turn3) with the turns of the column k of a radix-4
// pass, from w1 = w^k and w3 = conj(w^3k) in each half of V, or with those
// of its mirror q - k: w^(q - k) = i conj(w^k), w^2(q - k) = -conj(w^2k),
// w^3(q - k) = -i conj(w^3k).
template <typename V, typename F>
inline void ColumnTurns(V w1, V w3, bool mirror, F f) {
  const V c1 = DupLow(w1), s1 = DupHigh(w1);
  V c2, s2;
  SquareParts(c1, s1, &c2, &s2);
  const V c3 = DupLow(w3), s3 = DupHigh(w3);
  if (mirror) {
    f(Turn<V>{Neg(c2), s2}, Turn<V>{s1, c1}, TurnConj<V>{s3, c3});
  } else {
    f(Turn<V>{c2, s2}, Turn<V>{c1, s1}, TurnConj<V>{c3, s3});
  }
}

// One radix-4 pass over blocks of `length` elements, q = length/4
// butterflies each, twiddles from the sub-table t. Each twiddle is worked
// out once for all blocks.
template <typename V>
void Radix4Pass(int length, double* a, std::ptrdiff_t im, int h, const double* t) {
  const std::ptrdiff_t s = length / 2, step = 2 * length;
  const double* const end = a + 2 * h;
  Radix4Column<V>(a, end, step, s, im, Unturned(), Unturned(), Unturned());
  // w^(q - k) = i conj(w^k), w^2(q - k) = -conj(w^2k), w^3(q - k) = -i conj(w^3k).
  ForEachTwiddle<V>(length, t, [&](int k, V w1, V w3) {
    const V c1 = DupLow(w1), s1 = DupHigh(w1);
    V c2, s2;
    SquareParts(c1, s1, &c2, &s2);
    const V c3 = DupLow(w3), s3 = DupHigh(w3);
    Radix4Column<V>(a + 2 * k, end, step, s, im, Turn<V>{c2, s2}, Turn<V>{c1, s1},
                    TurnConj<V>{c3, s3});
    Radix4Column<V>(a + s - 2 * k, end, step, s, im, Turn<V>{Neg(c2), s2}, Turn<V>{s1, c1},
                    TurnConj<V>{s3, c3});
  });
  Radix4Column<V>(a + s / 2, end, step, s, im, TurnI(), TurnEighth(), TurnThreeEighths());
}

// The second stage on four elements: radix 2 with twiddles 1 and i.
template <typename V>
inline void SecondStage4(double* p, std::ptrdiff_t im) {
  const Complex2<V> p0 = Get<V>(p, im), p1 = Get<V>(p + 2, im);
  const Complex2<V> q0 = Get<V>(p + 4, im), q1 = Get<V>(p + 6, im);
  Put(p, im, p0 + q0);
  Put(p + 4, im, p0 - q0);
  Put(p + 2, im, PlusI(p1, q1));
  Put(p + 6, im, MinusI(p1, q1));
}

// The radix-4 pass on two columns at a time (paired_radix4.h), for a W that
// holds two V.
template <typename V, typename W>
void PairedRadix4Pass(int length, double* a, std::ptrdiff_t im, int h, const double* t);

// The first three stages forward in blocks of eight (paired_radix4.h), for
// a W that holds two V and h = n/4 an odd power of two from 32 on; n is
// kN where that is not 0.
template <typename V, typename W, int kN = 0>
void FirstStagesOfEight(int n, double* a);

// The complex stage up to its last stage, forward (exp(+...)) or on the
// conjugated input: a decimation in time of the h = n/4 elements from
// bit-reversed order to natural order, taking one or two first stages so
// that radix 4 does the rest; w_end points behind the twiddle region. The
// radix-4 passes run over W, two elements at a time, where W is wider than V.
// With kLastPass false the last pass, of length h, is left to the caller.
template <typename V, typename W, bool kConj, bool kLastPass = true>
void LaneTransform(int n, double* a, const double* w_end) {
  const int h = n >> 2;
  const std::ptrdiff_t im = 2 * h;
  int length = 16;
  if constexpr (!kConj && !std::is_same_v<V, W>) {
    if (n >= 128 && !(n & 0x55555555)) {
      // At the spectrogram's usual lengths these stages run with constant
      // offsets, 13 % faster at 2048.
      if (n == 512) {
        FirstStagesOfEight<V, W, 512>(n, a);
      } else if (n == 2048) {
        FirstStagesOfEight<V, W, 2048>(n, a);
      } else {
        FirstStagesOfEight<V, W>(n, a);
      }
      for (length = 32; kLastPass ? length <= h : length < h; length *= 4) {
        PairedRadix4Pass<V, W>(length, a, im, h, w_end - length / 2);
      }
      return;
    }
  }
  if (n >= 64 && (n & 0x55555555)) {
    FirstStages<V, W, kConj, 2>(n, a);
  } else {
    FirstStages<V, W, kConj, 1>(n, a);
    if (n == 16) {
      SecondStage4<V>(a, im);
    } else {
      length = 8;
    }
  }
  for (; kLastPass ? length <= h : length < h; length *= 4) {
    if constexpr (std::is_same_v<V, W>) {
      Radix4Pass<V>(length, a, im, h, w_end - length / 2);
    } else {
      PairedRadix4Pass<V, W>(length, a, im, h, w_end - length / 2);
    }
  }
}

}  // namespace CLIPWEAVER_ISA
}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_COMPLEX_FFT_H_
