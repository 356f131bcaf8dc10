// In-place FFT of a real sequence of power-of-two length, in double precision.
//
// Forward (direction >= 0), for x[0..n-1]:
//   R[k] = sum_j x[j] cos(2 pi j k / n),  I[k] = sum_j x[j] sin(2 pi j k / n),
// i.e. R + iI = sum_j x[j] exp(+2 pi i j k / n). The sine carries a PLUS sign:
// I is the negated imaginary part of the usual exp(-...) transform. Packed
// result, nothing scaled:
//   data[0] = R[0], data[1] = R[n/2],
//   data[2k] = R[k], data[2k+1] = I[k]   for 0 < k < n/2.
//
// Backward (direction < 0) takes that packing and returns, unscaled,
//   data[k] = (R[0] + R[n/2] cos(pi k)) / 2
//             + sum_{j=1}^{n/2-1} (R[j] cos(2 pi j k / n) + I[j] sin(2 pi j k / n)),
// so forward then backward gives the input times n/2; multiply by 2/n for the
// exact inverse.
//
// n must be a power of two, at least 2. Nothing is checked.
//
// Work areas, owned by the caller and always used as a pair:
//   bit_reversal_work: at least 2 + floor(sqrt(n/2)) ints. Element 0 must be 0
//     before the first call; after that it describes what twiddle_table holds.
//   twiddle_table: at least n/2 doubles.
// Tables are built on the first call and rebuilt only when a longer transform
// than any before is requested; tables built for length N serve every length
// up to N, so size the areas for the longest transform the pair will see.
//
// No allocation, no global state. Calls with different work-area pairs may run
// concurrently; one pair serves one call at a time, since any call may rebuild
// its tables.
#ifndef CLIPWEAVER_FFT_REAL_FFT_H_
#define CLIPWEAVER_FFT_REAL_FFT_H_

void RealFft(int n, int direction, double* data, int* bit_reversal_work,
             double* twiddle_table);

#endif  // CLIPWEAVER_FFT_REAL_FFT_H_
