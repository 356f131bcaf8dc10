#include "fft/real_transform_avx.h"

#include "fft/double4.h"
#include "fft/paired_radix4.h"
#include "fft/real_transform.h"

namespace fft_internal {

void RealTransformAvx(int n, int direction, double* data, const int* bit_reversal_work,
                      const double* twiddle_table) {
  RealTransform<Double2, Double4>(n, direction, data, bit_reversal_work, twiddle_table);
}

}  // namespace fft_internal
