// Twiddle and cosine tables of the real FFT, kept in the
// caller's work areas.
//
// bit_reversal_work[0] = nw, the size of the twiddle region at the start of
// the twiddle table; bit_reversal_work[1] = nc, the size of the cosine region
// right behind it. The rest of that area is left alone: the transform
// reverses indices on its own.
//
// The twiddle region is a chain of sub-tables, one per complex transform
// length L = 2 nw, nw, ..., 8, each of L/4 doubles and starting at nw - L/2,
// so a shorter transform finds its own at the end of the region. With
// t = 2 pi / L:
//   [0] = 1, [1] = cos(pi/4),
//   [2], [3] = 0.5 / cos(t), 0.5 / cos(3t)   (L = 16: cos(t), sin(t) instead;
//                                              L = 8: absent),
//   [4q .. 4q+3] = cos(2qt), sin(2qt), cos(6qt), -sin(6qt)  for 0 < q < L/16.
// The odd twiddles are midpoints of the even ones scaled by [2] and [3];
// those past an eighth of the circle follow by symmetry.
//
// The cosine region holds pairs, so that one load takes both weights of a
// bin: c[2j] = cos(j d) / 2, c[2j + 1] = sin(j d) / 2 for 0 < j < nc/2,
// with d = pi / (2 nc), and the pair for j = nc/2, cos(pi/4) / 2 twice, in
// c[0] and c[1].
#ifndef CLIPWEAVER_FFT_FFT_TABLES_H_
#define CLIPWEAVER_FFT_FFT_TABLES_H_

namespace fft_internal {

// Makes the tables fit a real transform of n points, rebuilding a region
// only when n exceeds what it was built for.
void EnsureTables(int n, int* bit_reversal_work, double* twiddle_table);

}  // namespace fft_internal

#endif  // CLIPWEAVER_FFT_FFT_TABLES_H_
