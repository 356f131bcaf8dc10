#include "jni/apm/analysis_frame_rate.h"

#include <cmath>

#include "jni/apm/spectrogram_calculator.h"

namespace apm {
namespace {

// The analyzer's window and overlap, in seconds.
constexpr float kWindowSeconds = 0.04f;
constexpr float kOverlapSeconds = 0.03f;

int32_t Samples(float seconds, double sample_rate) {
  return static_cast<int32_t>(
      std::round(static_cast<double>(seconds) * sample_rate));
}

}  // namespace

AnalysisFrameRate FrameRateAt(double sample_rate) {
  AnalysisFrameRate rate;
  if (!(sample_rate > 0 && sample_rate <= SpectrogramCalculator::kMaxSampleRate)) {
    return rate;
  }
  const int32_t step =
      Samples(kWindowSeconds, sample_rate) - Samples(kOverlapSeconds, sample_rate);
  if (step <= 0) return rate;
  rate.step = step;
  rate.frames_per_second = static_cast<int32_t>(sample_rate / step);
  rate.true_frames_per_second = sample_rate / step;
  return rate;
}

}  // namespace apm
