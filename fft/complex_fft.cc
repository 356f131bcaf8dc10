// Split-radix decimation in frequency: each step turns a length-L transform
// into one of length L/2 (even outputs) and two of length L/4 (outputs 1 and
// 3 mod 4), laid out so that the results end in bit-reversed order; a single
// permutation then puts them in place. The backward transform runs the same
// kernels on the conjugated data: it conjugates while reading the first step
// and while permuting.
#include "fft/complex_fft.h"

#include "fft/complex_ops.h"

namespace fft_internal {
namespace {

// u + iv and u - iv.
inline Cx PlusI(Cx u, Cx v) { return u + TimesI(v); }
inline Cx MinusI(Cx u, Cx v) { return u - TimesI(v); }
// Times exp(i pi/4) and exp(3i pi/4); c4 = cos(pi/4).
inline Cx RotEighth(Cx a, double c4) { return Scale(a + TimesI(a), c4); }
inline Cx RotThreeEighths(Cx a, double c4) { return Scale(TimesI(a) - a, c4); }

template <bool kConj>
inline Cx LoadIn(const double* p) {
  return kConj ? Conj(Load(p)) : Load(p);
}

// Leaf transforms on registers, outputs in bit-reversed order.

inline void Dft2(Cx* x) {
  const Cx s = x[0] + x[1];
  x[1] = x[0] - x[1];
  x[0] = s;
}

inline void Dft4(Cx* x) {
  const Cx s0 = x[0] + x[2], s1 = x[1] + x[3];
  const Cx u = x[0] - x[2], v = x[1] - x[3];
  x[0] = s0 + s1;
  x[1] = s0 - s1;
  x[2] = PlusI(u, v);
  x[3] = MinusI(u, v);
}

inline void Dft8(Cx* x, double c4) {
  const Cx u0 = x[0] - x[4], v0 = x[2] - x[6];
  const Cx u1 = x[1] - x[5], v1 = x[3] - x[7];
  x[0] = x[0] + x[4];
  x[1] = x[1] + x[5];
  x[2] = x[2] + x[6];
  x[3] = x[3] + x[7];
  x[4] = PlusI(u0, v0);
  x[5] = RotEighth(PlusI(u1, v1), c4);
  x[6] = MinusI(u0, v0);
  x[7] = RotThreeEighths(MinusI(u1, v1), c4);
  Dft4(x);
  Dft2(x + 4);
  Dft2(x + 6);
}

// t: the 16-point twiddles (1, cos(pi/4), cos(pi/8), sin(pi/8)).
inline void Dft16(Cx* x, const double* t) {
  const double c4 = t[1], c8 = t[2], s8 = t[3];
  Cx u[4], v[4];
  for (int k = 0; k < 4; ++k) {
    u[k] = x[k] - x[k + 8];
    v[k] = x[k + 4] - x[k + 12];
    x[k] = x[k] + x[k + 8];
    x[k + 4] = x[k + 4] + x[k + 12];
  }
  x[8] = PlusI(u[0], v[0]);
  x[9] = Mul(PlusI(u[1], v[1]), MakeCx(c8, s8));
  x[10] = RotEighth(PlusI(u[2], v[2]), c4);
  x[11] = Mul(PlusI(u[3], v[3]), MakeCx(s8, c8));
  x[12] = MinusI(u[0], v[0]);
  x[13] = Mul(MinusI(u[1], v[1]), MakeCx(s8, c8));
  x[14] = RotThreeEighths(MinusI(u[2], v[2]), c4);
  x[15] = Mul(MinusI(u[3], v[3]), MakeCx(-c8, -s8));
  Dft8(x, c4);
  Dft4(x + 8);
  Dft4(x + 12);
}

template <int kPoints>
inline void LoadAll(const double* a, Cx* x) {
  for (int k = 0; k < kPoints; ++k) x[k] = Load(a + 2 * k);
}
template <int kPoints>
inline void StoreAll(const Cx* x, double* a) {
  for (int k = 0; k < kPoints; ++k) Store(a + 2 * k, x[k]);
}

void Leaf8(double* a, double c4) {
  Cx x[8];
  LoadAll<8>(a, x);
  Dft8(x, c4);
  StoreAll<8>(x, a);
}

void Leaf16(double* a, const double* t) {
  Cx x[16];
  LoadAll<16>(a, x);
  Dft16(x, t);
  StoreAll<16>(x, a);
}

// One split-radix step at index p over quarters q doubles apart: the first
// two quarters get the sums, *plus and *minus the (u + iv), (u - iv) that the
// caller twiddles into the last two.
template <bool kConj>
inline void Split(const double* p, int q, double* sums, Cx* plus, Cx* minus) {
  const Cx a = LoadIn<kConj>(p), b = LoadIn<kConj>(p + q);
  const Cx c = LoadIn<kConj>(p + 2 * q), d = LoadIn<kConj>(p + 3 * q);
  Store(sums, a + c);
  Store(sums + q, b + d);
  const Cx u = a - c, v = b - d;
  *plus = PlusI(u, v);
  *minus = MinusI(u, v);
}

template <bool kConj>
inline void SplitTwiddled(double* p, int q, Cx w1, Cx w3) {
  Cx plus, minus;
  Split<kConj>(p, q, p, &plus, &minus);
  Store(p + 2 * q, Mul(plus, w1));
  Store(p + 3 * q, Mul(minus, w3));
}

// Index k and its mirror L/4 - k, whose twiddles are w^(L/4 - k) =
// i conj(w^k) = Swap(w^k) and w^(3(L/4 - k)) = -i conj(w^3k) = -Swap(w^3k).
template <bool kConj>
inline void SplitPair(double* a, int q, int offset, Cx w1, Cx w3) {
  SplitTwiddled<kConj>(a + offset, q, w1, w3);
  SplitTwiddled<kConj>(a + q - offset, q, Swap(w1), Conj(Swap(Conj(w3))));
}

// Split-radix step over a whole block of n doubles (n >= 64) with its
// twiddle sub-table tw (layout in fft_tables.h). Even indices read their
// twiddles, odd ones interpolate between neighbours.
template <bool kConj>
void SplitStep(int n, double* a, const double* tw) {
  const int q = n >> 2;
  const int eighth = q >> 1;
  const double c4 = tw[1], odd1 = tw[2], odd3 = tw[3];
  Cx plus, minus;
  Split<kConj>(a, q, a, &plus, &minus);
  Store(a + 2 * q, plus);
  Store(a + 3 * q, minus);
  Cx w1 = MakeCx(1, 0), w3 = w1;
  int j = 4;
  for (; j < eighth; j += 4) {
    const Cx n1 = Load(tw + j), n3 = Conj(Load(tw + j + 2));
    SplitPair<kConj>(a, q, j - 2, Scale(w1 + n1, odd1), Scale(w3 + n3, odd3));
    SplitPair<kConj>(a, q, j, n1, n3);
    w1 = n1;
    w3 = n3;
  }
  const Cx n1 = MakeCx(c4, c4), n3 = MakeCx(-c4, c4);
  SplitPair<kConj>(a, q, j - 2, Scale(w1 + n1, odd1), Scale(w3 + n3, odd3));
  Split<kConj>(a + eighth, q, a + eighth, &plus, &minus);
  Store(a + eighth + 2 * q, RotEighth(plus, c4));
  Store(a + eighth + 3 * q, RotThreeEighths(minus, c4));
}

// Finishes a block of n doubles whose first step is done; w_end points
// behind the twiddle region.
void FinishBlocks(int n, double* a, const double* w_end) {
  if (n == 32) {
    Leaf16(a, w_end - 8);
  } else if (n == 16) {
    Leaf8(a, w_end[-3]);
  } else {
    SplitStep<false>(n, a, w_end - (n >> 2));
    FinishBlocks(n >> 1, a, w_end);
    FinishBlocks(n >> 2, a + (n >> 1), w_end);
    FinishBlocks(n >> 2, a + (n >> 1) + (n >> 2), w_end);
  }
}

template <bool kConj>
inline void Exchange(double* x, double* y) {
  const Cx a = LoadIn<kConj>(x);
  Store(x, LoadIn<kConj>(y));
  Store(y, a);
}

constexpr int kReversed3[8] = {0, 4, 2, 6, 1, 5, 3, 7};
constexpr int kReversed4[16] = {0, 8, 4, 12, 2, 10, 6, 14, 1, 9, 5, 13, 3, 11, 7, 15};

// Bit-reversal permutation of n/2 >= 32 points. An index is split into a
// high and a low digit of r bits and a middle digit of kMidBits, where
// m = 2^r is the table level that fits n. rev[i] is the reversed digit i as
// an offset (to be shifted left by `scale`), so point (rev i, c, j) trades
// places with (rev j, rev c, i).
template <bool kConj, int kMidBits>
void BitReverse(int m, int scale, double* a, const int* rev) {
  constexpr int kMid = 1 << kMidBits;
  const int* mid = kMidBits == 3 ? kReversed3 : kReversed4;
  const int stride = 2 * m;
  for (int i = 0; i < m; ++i) {
    const int hi = rev[i] << scale;
    for (int j = 0; j < i; ++j) {
      double* x = a + hi + 2 * j;
      double* y = a + (rev[j] << scale) + 2 * i;
      for (int c = 0; c < kMid; ++c) Exchange<kConj>(x + stride * c, y + stride * mid[c]);
    }
    double* x = a + hi + 2 * i;
    for (int c = 0; c < kMid; ++c) {
      if (c < mid[c]) {
        Exchange<kConj>(x + stride * c, x + stride * mid[c]);
      } else if (kConj && c == mid[c]) {
        x[stride * c + 1] = -x[stride * c + 1];
      }
    }
  }
}

template <bool kConj>
void BitReverseTable(int n, double* a, const int* work) {
  int m = 2;
  int l = n >> 2;
  while (l > 32) {
    m <<= 1;
    l >>= 2;
  }
  if (l == 32) {
    BitReverse<kConj, 4>(m, 2, a, work + m);
  } else {
    BitReverse<kConj, 3>(m, 1, a, work + m);
  }
}

// Up to 16 points: one leaf, then a direct permutation.
template <bool kConj>
void SmallTransform(int n, double* a, const double* w_end) {
  if (kConj) {
    for (int k = 1; k < n; k += 2) a[k] = -a[k];
  }
  Cx x[4];
  switch (n) {
    case 4:
      LoadAll<2>(a, x);
      Dft2(x);
      StoreAll<2>(x, a);
      break;
    case 8:
      LoadAll<4>(a, x);
      Dft4(x);
      StoreAll<4>(x, a);
      break;
    case 16:
      Leaf8(a, w_end[-3]);
      break;
    default:
      Leaf16(a, w_end - 8);
      break;
  }
  const int points = n >> 1;
  for (int k = 0, r = 0; k < points; ++k) {
    if (k < r) Exchange<false>(a + 2 * k, a + 2 * r);
    // Increment r in reversed bit order.
    int bit = points >> 1;
    while (r & bit) {
      r ^= bit;
      bit >>= 1;
    }
    r |= bit;
  }
  if (kConj) {
    for (int k = 1; k < n; k += 2) a[k] = -a[k];
  }
}

template <bool kConj>
void Transform(int n, double* a, const int* work, const double* w) {
  const double* w_end = w + work[0];
  if (n < 64) {
    SmallTransform<kConj>(n, a, w_end);
    return;
  }
  SplitStep<kConj>(n, a, w_end - (n >> 2));
  FinishBlocks(n >> 1, a, w_end);
  FinishBlocks(n >> 2, a + (n >> 1), w_end);
  FinishBlocks(n >> 2, a + (n >> 1) + (n >> 2), w_end);
  BitReverseTable<kConj>(n, a, work);
}

}  // namespace

void ComplexFftForward(int n, double* a, const int* work, const double* w) {
  Transform<false>(n, a, work, w);
}

void ComplexFftBackward(int n, double* a, const int* work, const double* w) {
  Transform<true>(n, a, work, w);
}

}  // namespace fft_internal
