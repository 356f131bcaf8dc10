#include "jni/apm/spectrogram_calculator.h"

#include <cmath>

#include "base/logging.h"

namespace apm {
namespace {

int32_t SecondsToSamples(float seconds, double sample_rate) {
  return static_cast<int32_t>(
      std::round(static_cast<double>(seconds) * sample_rate));
}

}  // namespace

bool SpectrogramCalculator::Initialize(double sample_rate) {
  num_input_samples_ = 0;
  num_frames_ = 0;
  if (!(sample_rate > 0 && sample_rate <= kMaxSampleRate)) {
    LOG(ERROR) << "Unsupported sample rate " << sample_rate << " Hz.";
    spectrogram_ = Spectrogram();  // not initialised: the next run fails
    return false;
  }
  window_length_samples_ = SecondsToSamples(window_length_seconds_, sample_rate);
  overlap_samples_ = SecondsToSamples(overlap_seconds_, sample_rate);
  const int32_t step = window_length_samples_ - overlap_samples_;
  frames_per_second_ = step > 0 ? static_cast<int32_t>(sample_rate / step) : 0;
  return spectrogram_.Initialize(window_length_samples_, step);
}

bool SpectrogramCalculator::Failed() {
  LOG(ERROR) << "Failed to compute spectrogram!";
  return false;
}

bool SpectrogramCalculator::ComputeSpectrogram(
    const std::vector<float>& samples, std::vector<SpectrogramFrame>* output,
    ProgressCallback progress) {
  if (!spectrogram_.ComputeComplexSpectrogram(samples, output, progress)) {
    return Failed();
  }
  num_input_samples_ += static_cast<int64_t>(samples.size());
  num_frames_ += static_cast<int64_t>(output->size());
  return true;
}

void SpectrogramCalculator::BeginStream(int32_t total_samples) {
  stream_samples_ = 0;
  stream_frames_ = 0;
  const int32_t step = spectrogram_.step_length();
  stream_steps_ = step > 0 ? static_cast<float>(total_samples / step) : 0;
}

bool SpectrogramCalculator::StreamBlock(const float* samples, int32_t count,
                                        const ProgressCallback& progress,
                                        const FrameVisitor& on_frame) {
  if (!spectrogram_.is_initialized()) {
    // Let the spectrogram report that it was never initialised.
    std::vector<SpectrogramFrame> unused;
    spectrogram_.ComputeComplexSpectrogram({}, &unused, progress);
    return Failed();
  }
  int32_t start = 0;
  while (spectrogram_.TakeNextWindow(samples, count, &start)) {
    if (stream_frames_ % 100 == 0) {
      const float fraction =
          stream_steps_ > 0 ? static_cast<float>(stream_frames_) / stream_steps_
                            : 0;
      if (progress(fraction)) return Failed();
    }
    spectrogram_.TransformWindow();
    on_frame(spectrogram_.bins());
    ++stream_frames_;
  }
  stream_samples_ += count;
  return true;
}

void SpectrogramCalculator::EndStream() {
  num_input_samples_ += stream_samples_;
  num_frames_ += stream_frames_;
}

}  // namespace apm
