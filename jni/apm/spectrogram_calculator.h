// Turns the analysis window and overlap, given in seconds, into the sample
// counts of the spectrogram and fixes the frame rate of everything
// downstream.
#ifndef CLIPWEAVER_JNI_APM_SPECTROGRAM_CALCULATOR_H_
#define CLIPWEAVER_JNI_APM_SPECTROGRAM_CALCULATOR_H_

#include <cstdint>
#include <functional>
#include <vector>

#include "jni/apm/spectrogram.h"

namespace apm {

class SpectrogramCalculator {
 public:
  // Far above any audio rate; bounds the window that a hostile rate could
  // make the spectrogram allocate.
  static constexpr double kMaxSampleRate = 1e6;

  // Receives each finished frame as bin_count() (re, im) pairs of doubles.
  using FrameVisitor = std::function<void(const double* bins)>;

  SpectrogramCalculator(float window_length_seconds, float overlap_seconds)
      : window_length_seconds_(window_length_seconds),
        overlap_seconds_(overlap_seconds) {}

  bool Initialize(double sample_rate);

  // The spectrogram of `samples`, one row per complete window.
  bool ComputeSpectrogram(const std::vector<float>& samples,
                          std::vector<SpectrogramFrame>* output,
                          ProgressCallback progress);

  // The same analysis for a signal of `total_samples` samples that arrives in
  // blocks, so that neither the signal nor its spectrogram is ever held
  // whole. Progress and cancellation behave exactly as in one
  // ComputeSpectrogram call over the whole signal.
  void BeginStream(int32_t total_samples);
  bool StreamBlock(const float* samples, int32_t count,
                   const ProgressCallback& progress,
                   const FrameVisitor& on_frame);
  void EndStream();

  int32_t frames_per_second() const { return frames_per_second_; }
  int32_t bin_count() const { return spectrogram_.bin_count(); }

 private:
  bool Failed();

  float window_length_seconds_;
  float overlap_seconds_;
  Spectrogram spectrogram_;
  int32_t window_length_samples_ = 0;
  int32_t overlap_samples_ = 0;
  // Samples taken and frames made since Initialize; for a debugger, as
  // nothing in the analysis reads them.
  int64_t num_input_samples_ = 0;
  int64_t num_frames_ = 0;
  int32_t frames_per_second_ = 0;

  // State of the stream between BeginStream and EndStream.
  int32_t stream_samples_ = 0;
  int32_t stream_frames_ = 0;
  float stream_steps_ = 0;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_SPECTROGRAM_CALCULATOR_H_
