#include "tools/beat_analysis.h"

#include <cmath>
#include <cstdio>
#include <limits>

#include "jni/apm/analysis_frame_rate.h"
#include "jni/apm/audio_analyzer.h"
#include "jni/apm/tempo_estimate.h"
#include "tools/audio_file.h"
#include "tools/click_track.h"
#include "tools/interrupt.h"
#include "tools/svg_plot.h"

namespace cwtool {
namespace {

// The analyzer reads little-endian bytes; the decoded samples are handed
// over as they lie in memory.
static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__,
              "PCM is passed to the analyzer in host byte order");

std::string Seconds(double seconds) {
  char text[32];
  snprintf(text, sizeof(text), "%.2f s", seconds);
  return text;
}

std::string CheckLength(const DecodedAudio& audio) {
  if (audio.seconds() < kMinimumSeconds) {
    return "too short to analyse (" + Seconds(audio.seconds()) +
           "; at least " + Seconds(kMinimumSeconds) + " needed)";
  }
  const double max_bytes = std::numeric_limits<int32_t>::max();
  if (2.0 * static_cast<double>(audio.samples.size()) > max_bytes) {
    const double max_seconds =
        max_bytes / (2.0 * audio.channels * audio.sample_rate);
    return "too long to analyse (" + Seconds(audio.seconds()) +
           "; at most " + Seconds(max_seconds) + " at this rate and channel count)";
  }
  return std::string();
}

std::string WriteExtras(const ExtraOutputs& extras, const DecodedAudio& audio,
                        const apm::AudioAnalyzer& analyzer,
                        const BeatResult& result) {
  std::string error;
  if (!extras.click_path.empty() &&
      !WriteClickTrack(extras.click_path, audio, result.beats, &error)) {
    return extras.click_path + ": " + error;
  }
  if (!extras.plot_path.empty()) {
    const BeatPlot plot{result.path,
                        &audio,
                        &analyzer.detection_function(),
                        apm::FrameRateAt(audio.sample_rate).true_frames_per_second,
                        &result.beats,
                        std::isfinite(result.tempo) ? result.tempo : 0.0};
    if (!WriteBeatPlot(extras.plot_path, plot, &error)) {
      return extras.plot_path + ": " + error;
    }
  }
  return std::string();
}

// The library's times count whole frames per second; the frames they name
// lie at the true rate.
std::vector<double> TrueTimes(const float* beats, int32_t count,
                              int32_t frames_per_second, int32_t sample_rate) {
  const apm::AnalysisFrameRate rate = apm::FrameRateAt(sample_rate);
  std::vector<double> times(static_cast<size_t>(count));
  for (int32_t i = 0; i < count; ++i) {
    const double frame =
        std::round(static_cast<double>(beats[i]) * frames_per_second);
    times[i] = frame / rate.true_frames_per_second;
  }
  return times;
}

}  // namespace

BeatResult AnalyseFile(const std::string& path, const apm::ApmConfig& config,
                       const ExtraOutputs& extras,
                       const std::function<void(int)>& progress) {
  const std::atomic<bool>& stop = InterruptFlag();
  BeatResult result;
  result.path = path;
  DecodedAudio audio;
  if (!DecodeFile(path, stop, &audio, &result.error)) {
    result.interrupted = stop.load();
    return result;
  }
  result.sample_rate = audio.sample_rate;
  result.channels = audio.channels;
  result.duration = audio.seconds();
  result.error = CheckLength(audio);
  if (!result.error.empty()) return result;

  apm::AudioAnalyzer analyzer(audio.sample_rate, config);
  const int32_t count = analyzer.CalculateBeats(
      reinterpret_cast<const uint8_t*>(audio.samples.data()),
      static_cast<int32_t>(2 * audio.samples.size()), audio.channels,
      [&](char byte) {
        progress(static_cast<unsigned char>(byte) * 100 / 99);
        return stop.load();
      });
  // A cancelled tracking stage still returns a count (of 0).
  if (stop.load()) {
    result.interrupted = true;
    return result;
  }
  if (count < 0) {
    result.error = "the analysis failed (see --verbose for its log)";
    return result;
  }
  const std::vector<double> times = TrueTimes(
      analyzer.beats(), count, analyzer.frames_per_second(), audio.sample_rate);
  result.beats.assign(times.begin(), times.end());
  result.tempo = apm::PreciseTempo(times);
  if (count >= 2 && std::isfinite(analyzer.bpm()) && analyzer.bpm() > 0) {
    result.bpm = analyzer.bpm();
  }
  result.output_error = WriteExtras(extras, audio, analyzer, result);
  progress(100);
  return result;
}

}  // namespace cwtool
