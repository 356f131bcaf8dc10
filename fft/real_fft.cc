#include "fft/real_fft.h"

#include "base/instruction_set.h"
#include "fft/complex_ops.h"
#include "fft/fft_tables.h"
#include "fft/real_transform.h"
#include "fft/real_transform_avx.h"

void RealFft(int n, int direction, double* data, int* bit_reversal_work, double* twiddle_table) {
  fft_internal::EnsureTables(n, bit_reversal_work, twiddle_table);
#if defined(__x86_64__)
  if (instruction_set::HasAvx()) {
    fft_internal::RealTransformAvx(n, direction, data, bit_reversal_work, twiddle_table);
    return;
  }
#endif
  fft_internal::RealTransform<fft_internal::Double2>(n, direction, data, bit_reversal_work,
                                                     twiddle_table);
}
