#include "jni/apm/onset_detector.h"

#include <cmath>

#include "base/logging.h"

namespace apm {
namespace {

constexpr float kPi = 3.14159274f;
constexpr float kMinusTwoPi = -6.28318548f;

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
  previous_magnitudes_.assign(bin_count, {0.0f, 0.0f});
  previous_phases_.assign(bin_count, -kPi);
  second_previous_phases_.assign(bin_count, -kPi);
  magnitudes_.resize(bin_count);
  phases_.resize(bin_count);
  distances_.resize(bin_count);
}

float OnsetDetector::DetectFrame(const std::complex<float>* bins) {
  for (int32_t k = 0; k < bin_count_; ++k) {
    magnitudes_[k] = std::hypot(bins[k].real(), bins[k].imag());
    phases_[k] = std::atan2(bins[k].imag(), bins[k].real());
  }
  for (int32_t k = 0; k < bin_count_; ++k) {
    // Deviation of this phase from the linear prediction, shifted by pi and
    // wrapped back into (-pi, pi].
    const float shifted =
        ((phases_[k] - 2.0f * previous_phases_[k]) + second_previous_phases_[k]) +
        kPi;
    const float wrapped =
        kPi + (shifted - kMinusTwoPi * std::floor(shifted / kMinusTwoPi));
    const float re = previous_magnitudes_[k].real() -
                     magnitudes_[k] * std::cos(wrapped);
    const float im = 0.0f - magnitudes_[k] * std::sin(wrapped);
    distances_[k] = (std::isinf(re) || std::isinf(im))
                        ? INFINITY
                        : std::sqrt(re * re + im * im);
  }
  for (int32_t k = 0; k < bin_count_; ++k) {
    previous_magnitudes_[k] = {magnitudes_[k], 0.0f};
    second_previous_phases_[k] = previous_phases_[k];
    previous_phases_[k] = phases_[k];
  }
  return LaneSum(distances_.data(), bin_count_);
}

}  // namespace apm
