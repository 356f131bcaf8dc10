#include "tools/beat_analysis.h"

#include <cmath>
#include <cstdio>
#include <limits>

#include "jni/apm/audio_analyzer.h"
#include "tools/audio_file.h"
#include "tools/beat_view.h"
#include "tools/click_track.h"
#include "tools/html_page.h"
#include "tools/interrupt.h"
#include "tools/svg_plot.h"
#include "tools/text_file.h"

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
  if (extras.plot_path.empty() && extras.html_path.empty()) return std::string();
  BeatView view = MakeBeatView(result, audio, analyzer.detection_function(),
                               analyzer.frames_per_second());
  if (!extras.plot_path.empty() &&
      !WriteTextFile(extras.plot_path, BeatPlotSvg(view), &error)) {
    return extras.plot_path + ": " + error;
  }
  if (!extras.html_path.empty() &&
      (!AddCompactAudio(audio, &view, &error) ||
       !WriteTextFile(extras.html_path, BeatPageHtml(view), &error))) {
    return extras.html_path + ": " + error;
  }
  return std::string();
}

}  // namespace

BeatResult AnalyseFile(const std::string& path, const ExtraOutputs& extras,
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

  apm::AudioAnalyzer analyzer(audio.sample_rate);
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
  result.beats.assign(analyzer.beats(), analyzer.beats() + count);
  if (count >= 2 && std::isfinite(analyzer.bpm()) && analyzer.bpm() > 0) {
    result.bpm = analyzer.bpm();
  }
  result.output_error = WriteExtras(extras, audio, analyzer, result);
  progress(100);
  return result;
}

}  // namespace cwtool
