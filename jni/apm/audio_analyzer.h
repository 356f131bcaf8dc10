// One beat analysis of interleaved 16-bit PCM: mix-down, spectrogram, onset
// detection, conditioning of the detection function, tempo and beat
// tracking. Progress is reported through the caller's callback as a byte,
// 0..32 for the spectrogram, 33..65 for onset detection and 66..98 for
// tracking; a true answer cancels.
//
// The input streams in: Begin, any number of Feed calls with blocks of any
// size, Finish. CalculateBeats does the same over one buffer, so both give
// the same beats, progress bytes and log lines.
#ifndef CLIPWEAVER_JNI_APM_AUDIO_ANALYZER_H_
#define CLIPWEAVER_JNI_APM_AUDIO_ANALYZER_H_

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "jni/apm/apm.h"
#include "jni/apm/onset_detector.h"
#include "jni/apm/running_median.h"
#include "jni/apm/spectrogram_calculator.h"

namespace apm {

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

  // Starts a run over frame_count frames of channel_count channels. A
  // negative frame_count means the length is unknown: the spectrogram stage
  // then reports no progress. If more or fewer frames arrive than announced,
  // only the progress bytes are off. False when there is nothing to analyse;
  // Finish then returns -1.
  bool Begin(int32_t channel_count, int64_t frame_count,
             std::function<bool(char)> progress);
  // Mixes and analyses frame_count interleaved frames. False once the run
  // has stopped (failure or cancel); further blocks are ignored.
  bool Feed(const int16_t* interleaved, int32_t frame_count);
  // Runs the remaining stages. Returns the number of beats now in beats(),
  // or -1 when the run stopped before tracking.
  int32_t Finish();

  // One run over size_in_bytes of interleaved signed 16-bit little-endian
  // PCM (a trailing partial frame is ignored).
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
  // The stages' fractional progress as the overall byte of stage 0, 1 or 2.
  std::function<bool(float)> StageProgress(int32_t stage) const;
  void StartSpectrogram(int64_t frame_count);
  bool MixAndAnalyse(const uint8_t* interleaved, int32_t frame_count);
  bool FinishOnsetStage();
  void Track();
  int32_t GetBeats();

  int32_t sample_rate_;
  ApmConfig config_;
  std::unique_ptr<Apm> tracker_;
  SpectrogramCalculator spectrogram_calculator_;
  OnsetDetector onset_detector_;
  std::unique_ptr<float[]> beats_;

  // The run in progress.
  std::function<bool(char)> progress_;
  std::function<bool(float)> spectrogram_progress_;
  std::function<void(const double*)> detect_;
  bool running_ = false;
  bool length_known_ = false;
  int32_t channel_count_ = 0;
  int64_t frames_fed_ = 0;
  // One block of mono samples at a time: the whole signal is never held.
  std::vector<float> samples_;

  int32_t frames_per_second_ = 0;
  std::vector<float> detection_function_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_AUDIO_ANALYZER_H_
