#include "jni/apm/audio_analyzer.h"

#include <jni.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>

#include "base/logging.h"
#include "jni/apm/analysis_frame_rate.h"
#include "jni/apm/tempo_range.h"

namespace apm {
namespace {

constexpr float kWindowLengthSeconds = 0.04f;
constexpr float kOverlapSeconds = 0.03f;

// Mono samples mixed per block; bounds the memory of the mix-down whatever
// the length of the input.
constexpr int32_t kBlockFrames = 16384;

int16_t ReadSample(const uint8_t* bytes) {
  return static_cast<int16_t>(bytes[0] | (bytes[1] << 8));
}

// 0 + left is left: the same sums as MixChannels, in a loop that vectorises.
void MixStereo(const uint8_t* interleaved, int32_t count, float* mono) {
  for (int32_t i = 0; i < count; ++i, interleaved += 4) {
    mono[i] = (static_cast<float>(ReadSample(interleaved)) +
               static_cast<float>(ReadSample(interleaved + 2))) / 2.0f;
  }
}

void MixChannels(const uint8_t* pcm, int32_t channels, int32_t n, float* mono) {
  for (int32_t i = 0; i < n; ++i, pcm += 2 * channels) {
    float sum = 0;
    for (int32_t c = 0; c < channels; ++c) sum += ReadSample(pcm + 2 * c);
    mono[i] = sum / static_cast<float>(channels);
  }
}

}  // namespace

bool NormalizeDetectionFunction(std::vector<float>* values) {
  if (values->empty()) return false;
  const float largest = *std::max_element(values->begin(), values->end());
  if (!(largest > 0) || !std::isfinite(largest)) return false;
  for (float& v : *values) v = std::sqrt(v / largest);
  return true;
}

AudioAnalyzer::AudioAnalyzer(int32_t sample_rate, const ApmConfig& config)
    : sample_rate_(sample_rate),
      config_(config),
      spectrogram_calculator_(kWindowLengthSeconds, kOverlapSeconds) {}

AudioAnalyzer::~AudioAnalyzer() = default;

int32_t AudioAnalyzer::CalculateBeats(
    const uint8_t* data, int32_t size_in_bytes, int32_t channel_count,
    std::function<bool(char)> progress_callback) {
  const int64_t frame_size = 2 * static_cast<int64_t>(channel_count);
  const int64_t frame_count =
      channel_count < 1 || data == nullptr || size_in_bytes < frame_size
          ? 0
          : size_in_bytes / frame_size;
  if (Begin(channel_count, frame_count, std::move(progress_callback))) {
    MixAndAnalyse(data, static_cast<int32_t>(frame_count));
  }
  return Finish();
}

bool AudioAnalyzer::Begin(int32_t channel_count, int64_t frame_count,
                          std::function<bool(char)> progress) {
  beats_.reset();
  tracker_.reset();
  detection_function_.clear();
  running_ = false;
  frames_fed_ = 0;
  progress_ = std::move(progress);
  if (channel_count < 1) {
    LOG(ERROR) << "Channels are less than one!";
    return false;
  }
  channel_count_ = channel_count;
  length_known_ = frame_count >= 0;
  if (length_known_) {
    LOG(INFO) << "Input samples size: " << frame_count;
    if (frame_count == 0) return false;
  }
  StartSpectrogram(frame_count);
  running_ = true;
  return true;
}

bool AudioAnalyzer::Feed(const int16_t* interleaved, int32_t frame_count) {
  // Native 16-bit samples are the little-endian bytes the mix-down reads.
  static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__,
                "the mix-down reads little-endian samples");
  if (!running_) return false;
  return MixAndAnalyse(reinterpret_cast<const uint8_t*>(interleaved),
                       frame_count);
}

int32_t AudioAnalyzer::Finish() {
  if (!running_) return -1;
  running_ = false;
  spectrogram_calculator_.EndStream();
  if (!length_known_) {
    LOG(INFO) << "Input samples size: " << frames_fed_;
    if (frames_fed_ == 0) return -1;
  }
  if (!FinishOnsetStage()) return -1;
  Track();
  return GetBeats();
}

std::function<bool(float)> AudioAnalyzer::StageProgress(int32_t stage) const {
  return [this, stage](float fraction) {
    const float overall =
        std::fma(fraction, 33.0f, static_cast<float>(33 * stage));
    // A stream longer than announced would run into the next stage's bytes.
    const int byte = std::min(static_cast<int>(overall), 33 * stage + 32);
    return progress_ && progress_(static_cast<char>(byte));
  };
}

// The spectrogram and the onset detector run side by side over the blocks
// of the input, frame by frame, so neither the mono signal nor the
// spectrogram is ever held whole, nor even one frame of it in float: the
// detector rounds each bin to float as it reads it from the transform's
// doubles.
void AudioAnalyzer::StartSpectrogram(int64_t frame_count) {
  spectrogram_calculator_.Initialize(static_cast<double>(sample_rate_));
  frames_per_second_ = spectrogram_calculator_.frames_per_second();
  onset_detector_.Reset(spectrogram_calculator_.bin_count());
  // Progress only: a length past the 32-bit range reports it approximately.
  spectrogram_calculator_.BeginStream(static_cast<int32_t>(std::min<int64_t>(
      std::max<int64_t>(frame_count, 0), INT32_MAX)));
  spectrogram_progress_ = StageProgress(0);
  detect_ = [this](const double* bins) {
    // bin_count (re, im) pairs, the count the detector was reset for; the
    // values are those a stored frame of floats would give, as the
    // spectrogram's own frames are.
    detection_function_.push_back(onset_detector_.DetectFrame(bins));
  };
}

bool AudioAnalyzer::MixAndAnalyse(const uint8_t* interleaved,
                                  int32_t frame_count) {
  const int64_t frame_size = 2 * static_cast<int64_t>(channel_count_);
  while (frame_count > 0) {
    const int32_t count = std::min(kBlockFrames, frame_count);
    if (samples_.size() < static_cast<size_t>(count)) samples_.resize(count);
    // Stereo, the common case, has a loop of its own.
    if (channel_count_ == 2) {
      MixStereo(interleaved, count, samples_.data());
    } else {
      MixChannels(interleaved, channel_count_, count, samples_.data());
    }
    interleaved += count * frame_size;
    if (!spectrogram_calculator_.StreamBlock(samples_.data(), count,
                                             spectrogram_progress_, detect_)) {
      LOG(ERROR) << "Spectrogram process failed!";
      running_ = false;
      return false;
    }
    frames_fed_ += count;
    frame_count -= count;
  }
  return true;
}

// The detector already saw every frame; its stage's progress reports and
// cancellation point follow the spectrogram, where a separate pass over the
// stored frames would make them.
bool AudioAnalyzer::FinishOnsetStage() {
  const int32_t frame_count = static_cast<int32_t>(detection_function_.size());
  if (!onset_detector_.ReplayPass(frame_count, StageProgress(1))) {
    LOG(ERROR) << "Onset process failed!";
    return false;
  }
  return true;
}

void AudioAnalyzer::Track() {
  SubtractRunningMedian(2 * frames_per_second_ + 1, &detection_function_);
  const bool has_onsets = NormalizeDetectionFunction(&detection_function_);
  LOG(INFO) << "Preprocess done. apm input size: "
            << detection_function_.size();
  if (!has_onsets) {
    LOG(ERROR) << "No onsets above the running median (silent or steady "
                  "input): no beats to track.";
    return;
  }
  tracker_ = std::make_unique<Apm>(config_, detection_function_,
                                   frames_per_second_);
  tracker_->Run(StageProgress(2));
}

int32_t AudioAnalyzer::GetBeats() {
  std::vector<double> times;
  if (tracker_) {
    LOG(INFO) << "Estimated BPM = " << tracker_->bpm();
    times = tracker_->beat_times();
  }
  beats_ = std::make_unique<float[]>(times.size());
  for (size_t i = 0; i < times.size(); ++i) {
    beats_[i] = static_cast<float>(times[i]);
  }
  return static_cast<int32_t>(times.size());
}

}  // namespace apm

namespace {

// Calls the receiver's shouldCancelExtraction(byte). A Java exception from
// it cancels the analysis and stays pending for the Java caller; no further
// call into Java is made after it.
class JavaProgress {
 public:
  JavaProgress(JNIEnv* env, jobject receiver) : env_(env), receiver_(receiver) {
    jclass receiver_class = env->GetObjectClass(receiver);
    method_ = env->GetMethodID(receiver_class, "shouldCancelExtraction", "(B)Z");
    if (method_ == nullptr) env->ExceptionClear();
    env->DeleteLocalRef(receiver_class);
    if (method_ == nullptr) {
      LOG(WARNING) << "shouldCancelExtraction(byte) not found: running "
                      "without progress reports.";
    }
  }

  bool operator()(char progress) {
    if (threw_) return true;
    if (method_ == nullptr) return false;
    const jboolean cancel = env_->CallBooleanMethod(
        receiver_, method_, static_cast<jbyte>(progress));
    if (env_->ExceptionCheck()) {
      threw_ = true;
      return true;
    }
    return cancel != JNI_FALSE;
  }

  bool threw() const { return threw_; }

 private:
  JNIEnv* env_;
  jobject receiver_;
  jmethodID method_ = nullptr;
  bool threw_ = false;
};

// The bytes of a direct buffer that may be read, or null for a buffer
// without an address; a size beyond the capacity is clamped to it.
const uint8_t* DirectPcm(JNIEnv* env, jobject buffer, jint* size_in_bytes) {
  if (buffer == nullptr) return nullptr;
  const jlong capacity = env->GetDirectBufferCapacity(buffer);
  void* address = env->GetDirectBufferAddress(buffer);
  if (capacity < 0 || (address == nullptr && capacity > 0)) return nullptr;
  if (*size_in_bytes > capacity) {
    LOG(WARNING) << "PCM size " << *size_in_bytes
                 << " bytes exceeds the buffer capacity of " << capacity
                 << " bytes; analysing the capacity.";
    *size_in_bytes = static_cast<jint>(capacity);
  }
  // An empty direct buffer may have no address; it simply has no samples.
  static const uint8_t kNoSamples = 0;
  return address != nullptr ? static_cast<const uint8_t*>(address)
                            : &kNoSamples;
}

// The analysis behind both entries, which differ only in how the tracker
// is set up. Callers follow the library's log: the wording of these lines
// is theirs to rely on, so it stays as the beat entry has always written
// it.
jfloatArray BeatsInSec(JNIEnv* env, jobject receiver, jobject pcm_buffer,
                       jint size_in_bytes, jint sample_rate, jint channel_count,
                       const apm::ApmConfig& config) {
  const uint8_t* data = DirectPcm(env, pcm_buffer, &size_in_bytes);
  if (data == nullptr) {
    LOG(ERROR) << "The PCM buffer is not a direct buffer: nothing analysed.";
    return env->NewFloatArray(0);
  }
  apm::AudioAnalyzer analyzer(sample_rate, config);
  JavaProgress java_progress(env, receiver);
  int32_t n = analyzer.CalculateBeats(
      data, size_in_bytes, channel_count,
      [&java_progress](char progress) { return java_progress(progress); });
  if (n < 0) {
    LOG(ERROR) << "Failed to retrieve beats from APM!";
    n = 0;
  }
  LOG(INFO) << "Gets " << n << " beats from APM!";
  if (java_progress.threw()) return nullptr;
  jfloatArray beats = env->NewFloatArray(n);
  if (beats == nullptr) return nullptr;
  if (n > 0) env->SetFloatArrayRegion(beats, 0, n, analyzer.beats());
  return beats;
}

}  // namespace

extern "C" JNIEXPORT jfloatArray JNICALL
Java_com_quilby_norvane_apps_clipweaver_music_detail_DefaultLocalMusicDetailExtractor_calculateBeatsInSec(
    JNIEnv* env, jobject receiver, jobject pcm_buffer, jint size_in_bytes,
    jint sample_rate, jint channel_count) {
  if (env == nullptr || receiver == nullptr) return nullptr;
  return BeatsInSec(env, receiver, pcm_buffer, size_in_bytes, sample_rate,
                    channel_count, apm::ApmConfig());
}

// The same analysis with the tracker held to a tempo range. The Java side
// checks the range first; one reaching here anyway is refused before any
// work.
extern "C" JNIEXPORT jfloatArray JNICALL
Java_com_quilby_norvane_apps_clipweaver_music_detail_DefaultLocalMusicDetailExtractor_calculateBeatsInTempoRange(
    JNIEnv* env, jobject receiver, jobject pcm_buffer, jint size_in_bytes,
    jint sample_rate, jint channel_count, jfloat min_bpm, jfloat max_bpm) {
  if (env == nullptr || receiver == nullptr) return nullptr;
  const std::string range_error = apm::TempoRangeError(
      min_bpm, max_bpm, apm::FrameRateAt(sample_rate).frames_per_second);
  if (!range_error.empty()) {
    LOG(ERROR) << "Refused: " << range_error << ".";
    return env->NewFloatArray(0);
  }
  return BeatsInSec(env, receiver, pcm_buffer, size_in_bytes, sample_rate,
                    channel_count, apm::ConfigForTempoRange(min_bpm, max_bpm));
}
