// The radix-4 pass of complex_fft.h with two neighbouring columns per
// butterfly: W holds two elements, each half a V, and each half gets the
// twiddles its own column takes in Radix4Pass, so the bits are the same.
// Columns pair up as (0, 1), (2, 3), ... below the middle column q/2 and
// (q/2, q/2 + 1), ... from it on; the second run holds the mirrors q - k,
// so there the pairs are {k, k - 1} for even k, and the middle column pairs
// with the mirror of q/2 - 1.
#ifndef CLIPWEAVER_FFT_PAIRED_RADIX4_H_
#define CLIPWEAVER_FFT_PAIRED_RADIX4_H_

#include <cstddef>

#include "fft/complex_fft.h"
#include "fft/complex_ops.h"
#include "fft/twiddles.h"

namespace fft_internal {
inline namespace CLIPWEAVER_ISA {

// The radix-2 stage of FirstStages and the radix-4 pass of length 8, done
// on each block of eight in registers with the same arithmetic. Block B
// starts from element R = reverse(B), and its pairs of positions (0, 1) ..
// (6, 7) come from the elements R, R + h/4, R + h/8 and R + 3h/8, each
// with the one h/2 on. The blocks with R from 4g to 4g + 3 form group g,
// which reads what group reverse(g) writes; one group of each pair goes
// through a buffer.
template <typename V, typename W, int kN>
void FirstStagesOfEight(int n, double* a) {
  if constexpr (kN != 0) n = kN;
  const int h = n >> 2;
  const std::ptrdiff_t im = 2 * h;
  int bits = 0;
  for (int m = h; m > 1; m >>= 1) ++bits;
  // Offsets in doubles: h/2 is h/8 elements.
  const std::ptrdiff_t eighth = h / 2;
  const auto read = [&](const double* x) { return ReadJoinedPair<W>(x, h); };
  // Every step is inlined by force: GCC, taking the calls for cold, would
  // otherwise call one of them for each block, 10 % slower.
  const auto block = [&](const double* x, double* p,
                         std::ptrdiff_t p_im) __attribute__((always_inline)) {
    const Complex2<W> x0 = read(x);
    const Complex2<W> x1 = Split(Unturned(), TurnI())(read(x + 2 * eighth));
    const Complex2<W> x2 = Split(Unturned(), TurnEighth())(read(x + eighth));
    const Complex2<W> x3 = Split(Unturned(), TurnThreeEighths())(read(x + 3 * eighth));
    const Complex2<W> t0 = x0 + x1, t1 = x0 - x1, u = x2 + x3, v = x2 - x3;
    Put(p, p_im, t0 + u);
    Put(p + 4, p_im, PlusI(t1, v));
    Put(p + 8, p_im, t0 - u);
    Put(p + 12, p_im, MinusI(t1, v));
  };
  // Block 4g + r of a group lands r reversed (over two bits) times h/2 on.
  const auto group = [&](int g, double* p, std::ptrdiff_t p_im,
                         std::ptrdiff_t spacing) __attribute__((always_inline)) {
    const double* const x = a + 16 * g;
    block(x, p, p_im);
    block(x + 4, p + 2 * spacing, p_im);
    block(x + 8, p + spacing, p_im);
    block(x + 12, p + 3 * spacing, p_im);
  };
  constexpr std::ptrdiff_t kBufferIm = 64;
  double buffer[2 * kBufferIm];
  const auto unbuffer = [&](double* p) {
    for (int r = 0; r < 4; ++r, p += eighth) {
      for (int u = 0; u < 16; u += 4) Put(p + u, im, Get<W>(buffer + 16 * r + u, kBufferIm));
    }
  };
  ForEachReversal(
      bits - 5,
      [&](int g, int partner) __attribute__((always_inline)) {
        group(g, buffer, kBufferIm, 16);
        group(partner, a + 16 * g, im, eighth);
        unbuffer(a + 16 * partner);
      },
      [&](int g) __attribute__((always_inline)) {
        group(g, buffer, kBufferIm, 16);
        unbuffer(a + 16 * g);
      });
}

// Flattened: left as calls, the columns take their turns through memory.
template <typename V, typename W>
__attribute__((flatten)) void PairedRadix4Pass(int length, double* a, std::ptrdiff_t im, int h,
                                               const double* t) {
  const std::ptrdiff_t s = length / 2, step = 2 * length;
  const double* const end = a + 2 * h;
  const auto column = [&](double* p, auto turn2, auto turn1, auto turn3) {
    Radix4Column<W>(p, end, step, s, im, turn2, turn1, turn3);
  };
  if (length == 8) {
    column(a, Split(Unturned(), TurnI()), Split(Unturned(), TurnEighth()),
           Split(Unturned(), TurnThreeEighths()));
    return;
  }
  // Turns of two columns, one per half.
  V previous1 = Splat<V>(0), previous3 = previous1;
  ForEachTwiddle<V>(length, t, [&](int k, V w1, V w3) {
    if (k == 1) {
      ColumnTurns(Join(w1, w1), Join(w3, w3), false, [&](auto t2, auto t1, auto t3) {
        column(a, Split(Unturned(), t2), Split(Unturned(), t1), Split(Unturned(), t3));
      });
    } else if (k % 2) {
      ColumnTurns(Join(previous1, w1), Join(previous3, w3), false,
                  [&](auto t2, auto t1, auto t3) { column(a + 2 * (k - 1), t2, t1, t3); });
    } else {
      ColumnTurns(Join(w1, previous1), Join(w3, previous3), true,
                  [&](auto t2, auto t1, auto t3) { column(a + s - 2 * k, t2, t1, t3); });
    }
    previous1 = w1;
    previous3 = w3;
  });
  ColumnTurns(Join(previous1, previous1), Join(previous3, previous3), true,
              [&](auto t2, auto t1, auto t3) {
                column(a + s / 2, Split(TurnI(), t2), Split(TurnEighth(), t1),
                       Split(TurnThreeEighths(), t3));
              });
}

}  // namespace CLIPWEAVER_ISA
}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_PAIRED_RADIX4_H_
