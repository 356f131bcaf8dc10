// Complex FFT stage of the real FFT: n/2 complex points stored as (re, im)
// pairs in a[0 .. n-1], transformed in place into natural order, unscaled.
// Uses the tables that EnsureTables built for a real length of at least n.
#ifndef CLIPWEAVER_FFT_COMPLEX_FFT_H_
#define CLIPWEAVER_FFT_COMPLEX_FFT_H_

namespace fft_internal {

// X[k] = sum_j x[j] exp(+2 pi i j k / (n/2)). n >= 4.
void ComplexFftForward(int n, double* a, const int* bit_reversal_work,
                       const double* twiddle_table);

// Same with exp(-2 pi i j k / (n/2)).
void ComplexFftBackward(int n, double* a, const int* bit_reversal_work,
                        const double* twiddle_table);

}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_COMPLEX_FFT_H_
