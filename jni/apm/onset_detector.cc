#include "jni/apm/onset_detector.h"

#include <cmath>

#include "base/float4.h"
#include "base/instruction_set.h"
#include "base/logging.h"
#include "jni/apm/onset_bins.h"
#include "jni/apm/onset_bins_avx.h"

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

float OnsetDetector::DetectFrame(const std::complex<float>* bins) {
  const float* x = reinterpret_cast<const float*>(bins);
  float* state[] = {previous_magnitudes_.data(),
                    previous_phasors_re_.data(),
                    previous_phasors_im_.data(),
                    second_previous_phasors_re_.data(),
                    second_previous_phasors_im_.data(),
                    distances_.data()};
  int32_t k = 0;
#if defined(__x86_64__)
  if (instruction_set::HasAvx()) {
    k = DetectBinsAvx(x, bin_count_, state[0], state[1], state[2], state[3],
                      state[4], state[5]);
  }
#endif
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
