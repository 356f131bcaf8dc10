// Real transform of n points as a complex transform of n/2 points (even
// samples real, odd samples imaginary) followed by the split step that
// separates the two interleaved half-length spectra.
#include "fft/real_fft.h"

#include "fft/complex_fft.h"
#include "fft/complex_ops.h"
#include "fft/fft_tables.h"

namespace fft_internal {
namespace {

// Pairs bin j/2 with bin (n-j)/2 for j = 2, 4, ..., n/2 - 2, with the weight
// (1 - sin(pi j / n)) / 2 + i cos(pi j / n) / 2 read from the cosine region c
// of nc entries; the backward direction uses its conjugate.
template <bool kBackward>
void SplitSpectra(int n, double* a, int nc, const double* c) {
  const int step = 2 * nc / (n >> 1);
  int kk = 0;
  for (int j = 2; j < (n >> 1); j += 2) {
    kk += step;
    const Cx weight = MakeCx(0.5 - c[nc - kk], c[kk]);
    const Cx low = Load(a + j);
    const Cx high = Load(a + n - j);
    const Cx y = Mul(low - Conj(high), kBackward ? Conj(weight) : weight);
    Store(a + j, low - y);
    Store(a + n - j, high + Conj(y));
  }
}

}  // namespace
}  // namespace fft_internal

void RealFft(int n, int direction, double* data, int* bit_reversal_work,
             double* twiddle_table) {
  fft_internal::EnsureTables(n, bit_reversal_work, twiddle_table);
  const int nw = bit_reversal_work[0];
  const int nc = bit_reversal_work[1];
  if (direction >= 0) {
    if (n >= 4) {
      fft_internal::ComplexFftForward(n, data, bit_reversal_work, twiddle_table);
    }
    if (n > 4) fft_internal::SplitSpectra<false>(n, data, nc, twiddle_table + nw);
    const double difference = data[0] - data[1];
    data[0] += data[1];
    data[1] = difference;
  } else {
    data[1] = 0.5 * (data[0] - data[1]);
    data[0] -= data[1];
    if (n > 4) fft_internal::SplitSpectra<true>(n, data, nc, twiddle_table + nw);
    if (n >= 4) {
      fft_internal::ComplexFftBackward(n, data, bit_reversal_work, twiddle_table);
    }
  }
}
