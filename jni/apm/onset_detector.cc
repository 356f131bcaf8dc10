#include "jni/apm/onset_detector.h"

#include <cmath>

#include "base/float4.h"
#include "base/logging.h"

namespace apm {
namespace {

// The phasor of the phase -pi (as the float nearest to pi).
constexpr float kStartPhasorRe = -1.0f;
constexpr float kStartPhasorIm = 8.742278e-8f;

// Sums four lanes side by side, then the lanes pairwise, then the bins that
// do not fill a lane group, so the result is the same on every vector width.
float LaneSum(const float* values, int32_t count) {
  float lane[4] = {0, 0, 0, 0};
  int32_t k = 0;
  for (; k + 4 <= count; k += 4) {
    for (int j = 0; j < 4; ++j) lane[j] += values[k + j];
  }
  float sum = (lane[0] + lane[1]) + (lane[2] + lane[3]);
  for (; k < count; ++k) sum += values[k];
  return sum;
}

}  // namespace

bool OnsetDetector::EmptyInput() {
  LOG(ERROR) << "Empty input for onset detector! ";
  return false;
}

bool OnsetDetector::ComputeDetectionFunction(
    const std::vector<SpectrogramFrame>& spectrogram, std::vector<float>* output,
    ProgressCallback progress, bool clear_output) {
  if (clear_output) output->clear();
  if (spectrogram.empty()) return EmptyInput();
  Reset(static_cast<int32_t>(spectrogram[0].size()));
  const int32_t frame_count = static_cast<int32_t>(spectrogram.size());
  for (int32_t t = 0; t < frame_count; ++t) {
    if (t % 100 == 0 && progress(static_cast<float>(t) / frame_count)) {
      return false;
    }
    if (static_cast<int32_t>(spectrogram[t].size()) != bin_count_) {
      LOG(ERROR) << "Onset detector frame " << t << " has "
                 << spectrogram[t].size() << " bins, expected " << bin_count_;
      return false;
    }
    output->push_back(DetectFrame(spectrogram[t].data()));
  }
  return true;
}

bool OnsetDetector::ReplayPass(int32_t frame_count,
                               const ProgressCallback& progress) const {
  if (frame_count == 0) return EmptyInput();
  for (int32_t t = 0; t < frame_count; t += 100) {
    if (progress(static_cast<float>(t) / frame_count)) return false;
  }
  return true;
}

void OnsetDetector::Reset(int32_t bin_count) {
  bin_count_ = bin_count;
  previous_magnitudes_.assign(bin_count, 0.0f);
  previous_phasors_re_.assign(bin_count, kStartPhasorRe);
  previous_phasors_im_.assign(bin_count, kStartPhasorIm);
  second_previous_phasors_re_.assign(bin_count, kStartPhasorRe);
  second_previous_phasors_im_.assign(bin_count, kStartPhasorIm);
  distances_.resize(bin_count);
}

// One step for bins k .. k + lanes - 1, lanes being 4 for Float4 and 1 for
// float; both compute the same bits.
template <typename V>
inline void DetectBins(const float* bins, int32_t k, float* previous_magnitude,
                       float* u1_re, float* u1_im, float* u2_re, float* u2_im,
                       float* distance) {
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
  simd::Store(distance + k, simd::Sqrt(d_re * d_re + d_im * d_im));
  simd::Store(previous_magnitude + k, magnitude);
  simd::Store(u2_re + k, p1_re);
  simd::Store(u2_im + k, p1_im);
  simd::Store(u1_re + k, u_re);
  simd::Store(u1_im + k, u_im);
}

float OnsetDetector::DetectFrame(const std::complex<float>* bins) {
  const float* x = reinterpret_cast<const float*>(bins);
  float* state[] = {previous_magnitudes_.data(),
                    previous_phasors_re_.data(),
                    previous_phasors_im_.data(),
                    second_previous_phasors_re_.data(),
                    second_previous_phasors_im_.data(),
                    distances_.data()};
  int32_t k = 0;
  for (; k + 4 <= bin_count_; k += 4) {
    DetectBins<simd::Float4>(x, k, state[0], state[1], state[2], state[3],
                             state[4], state[5]);
  }
  for (; k < bin_count_; ++k) {
    DetectBins<float>(x, k, state[0], state[1], state[2], state[3], state[4],
                      state[5]);
  }
  return LaneSum(distances_.data(), bin_count_);
}

}  // namespace apm
