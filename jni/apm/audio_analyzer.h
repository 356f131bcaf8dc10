// One beat analysis of a PCM buffer: mix-down, spectrogram, onset
// detection, conditioning of the detection function, tempo and beat
// tracking. Progress is reported through the caller's callback as a byte,
// 0..32 for the spectrogram, 33..65 for onset detection and 66..98 for
// tracking; a true answer cancels.
#ifndef CLIPWEAVER_JNI_APM_AUDIO_ANALYZER_H_
#define CLIPWEAVER_JNI_APM_AUDIO_ANALYZER_H_

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "jni/apm/apm.h"
#include "jni/apm/onset_detector.h"
#include "jni/apm/spectrogram_calculator.h"

namespace apm {

// Removes the slowly varying level: each value minus the upper median of
// the window_length values around it (fewer at the ends), kept when
// positive. Runs in place from left to right, so each window already sees
// the rewritten values to the left of its centre.
void SubtractRunningMedian(int32_t window_length, std::vector<float>* values);

// Divides by the largest value and takes the square root, so the result
// lies in 0..1 with maximum 1. Returns false, leaving the values as they
// are, when the largest value is 0 or not finite (nothing to normalise).
bool NormalizeDetectionFunction(std::vector<float>* values);

class AudioAnalyzer {
 public:
  // config sets up the tracker; the default is the JNI beat entry's.
  explicit AudioAnalyzer(int32_t sample_rate,
                         const ApmConfig& config = ApmConfig());
  virtual ~AudioAnalyzer();
  AudioAnalyzer(const AudioAnalyzer&) = delete;
  AudioAnalyzer& operator=(const AudioAnalyzer&) = delete;

  // Analyses size_in_bytes of interleaved signed 16-bit little-endian PCM
  // (a trailing partial frame is ignored). Returns the number of beats now
  // in beats(), or -1 when the analysis stopped before tracking.
  int32_t CalculateBeats(const uint8_t* data, int32_t size_in_bytes,
                         int32_t channel_count,
                         std::function<bool(char)> progress_callback);

  // Beat times in seconds, valid until the analyzer is destroyed; null
  // after a -1 result.
  const float* beats() const { return beats_.get(); }

  // What the last run measured, for tools that show their work.
  double bpm() const { return tracker_ ? tracker_->bpm() : 0.0; }
  int32_t frames_per_second() const { return frames_per_second_; }
  const std::vector<float>& detection_function() const {
    return detection_function_;
  }

 private:
  void ReleaseBeats();
  bool MixDownToMono(const uint8_t* data, int32_t size_in_bytes,
                     int32_t channel_count);
  bool RunPipeline(const std::function<bool(float)>& stage_progress);
  bool ComputeDetectionFunction(
      const std::function<bool(float)>& stage_progress);
  int32_t GetBeats();

  // One block of mono samples at a time: the whole signal is never held.
  std::vector<float> samples_;
  int32_t sample_rate_;
  ApmConfig config_;
  std::unique_ptr<Apm> tracker_;
  SpectrogramCalculator spectrogram_calculator_;
  OnsetDetector onset_detector_;
  std::unique_ptr<float[]> beats_;
  int32_t stage_ = 0;

  // The input of the current run.
  const uint8_t* pcm_ = nullptr;
  int32_t channel_count_ = 0;
  int32_t sample_count_ = 0;

  int32_t frames_per_second_ = 0;
  std::vector<float> detection_function_;
  SpectrogramFrame frame_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_AUDIO_ANALYZER_H_
