// The per-bin step of the onset detector over any lane type of the vector
// vocabulary: magnitude and unit phasor of each bin, its distance from the
// prediction of the two frames before, and the state moved on by a frame.
#ifndef CLIPWEAVER_JNI_APM_ONSET_BINS_H_
#define CLIPWEAVER_JNI_APM_ONSET_BINS_H_

#include <cstdint>

#include "base/float4.h"

namespace apm {
inline namespace CLIPWEAVER_ISA {

// One step for bins k .. k + lanes - 1, lanes being 8 for Float8, 4 for
// Float4 and 1 for float; all compute the same bits. Bins of doubles are
// taken at the nearest float, as a stored frame holds them. Returns the
// distances.
template <typename V, typename T>
inline V DetectBins(const T* bins, int32_t k, float* previous_magnitude, float* u1_re,
                    float* u1_im, float* u2_re, float* u2_im) {
  using simd::Load;
  V re, im;
  simd::LoadComplex(bins + 2 * k, &re, &im);
  const V magnitude = simd::Sqrt(re * re + im * im);
  // A silent bin gets the phasor (1, 0) of phase 0, as atan2(0, 0) says;
  // dividing by magnitude + 1 there is dividing by 1.
  const V silent = simd::OneIfZero(magnitude);
  const V inverse = simd::Splat<V>(1.0f) / (magnitude + silent);
  const V u_re = re * inverse + silent;
  const V u_im = im * inverse;
  // The phase advanced by the last step: u1 * u1 * conj(u2).
  const V p1_re = Load<V>(u1_re + k), p1_im = Load<V>(u1_im + k);
  const V p2_re = Load<V>(u2_re + k), p2_im = Load<V>(u2_im + k);
  const V a_re = p1_re * p1_re - p1_im * p1_im;
  const V a_im = simd::Splat<V>(2.0f) * p1_re * p1_im;
  const V predicted_re = a_re * p2_re + a_im * p2_im;
  const V predicted_im = a_im * p2_re - a_re * p2_im;
  const V p = Load<V>(previous_magnitude + k);
  const V d_re = p * predicted_re - re;
  const V d_im = p * predicted_im - im;
  simd::Store(previous_magnitude + k, magnitude);
  simd::Store(u2_re + k, p1_re);
  simd::Store(u2_im + k, p1_im);
  simd::Store(u1_re + k, u_re);
  simd::Store(u1_im + k, u_im);
  return simd::Sqrt(d_re * d_re + d_im * d_im);
}

}  // namespace CLIPWEAVER_ISA
}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_ONSET_BINS_H_
