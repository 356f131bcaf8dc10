#include "tools/beat_analysis.h"

#include <cmath>
#include <cstdio>
#include <memory>
#include <utility>

#include "jni/apm/analysis_frame_rate.h"
#include "jni/apm/audio_analyzer.h"
#include "jni/apm/tempo_estimate.h"
#include "tools/audio_file.h"
#include "tools/beat_view.h"
#include "tools/click_track.h"
#include "tools/html_page.h"
#include "tools/interrupt.h"
#include "tools/svg_plot.h"

namespace cwtool {
namespace {

// Large enough that decoding and feeding cost little per call, small
// enough to stay out of the memory figures.
constexpr int32_t kBlockFrames = 1 << 14;
// The analyzer's spectrogram stage takes bytes 0..32 of its 0..98.
constexpr int kSpectrogramPercent = 33;

std::string Seconds(double seconds) {
  char text[32];
  snprintf(text, sizeof(text), "%.2f s", seconds);
  return text;
}

std::string TooShort(double seconds) {
  return "too short to analyse (" + Seconds(seconds) + "; at least " +
         Seconds(kMinimumSeconds) + " needed)";
}

// The onset curve outlives the analyzer, so that the tracker's tables, the
// analysis's largest part, are gone before the views are drawn.
struct OnsetCurve {
  std::vector<float> values;
  double per_second = 0;  // at the true frame rate, as the beats are
};

std::string WriteExtras(const ExtraOutputs& extras, BeatViewSignal* signal,
                        OnsetCurve onset, const BeatResult& result) {
  std::string error;
  if (!extras.click_path.empty() &&
      !WriteClickTrack(extras.click_path, result.path, result.beats, &error)) {
    return Interrupted() ? std::string() : extras.click_path + ": " + error;
  }
  if (signal == nullptr) return std::string();
  BeatView view;
  if (!signal->MakeView(result, std::move(onset.values), onset.per_second, &view, &error)) {
    return extras.html_path + ": " + error;
  }
  if (!extras.plot_path.empty() &&
      !WriteBeatPlot(extras.plot_path, view, &error)) {
    return extras.plot_path + ": " + error;
  }
  if (!extras.html_path.empty() &&
      !WriteBeatPage(extras.html_path, view, &error)) {
    return extras.html_path + ": " + error;
  }
  return std::string();
}

// Decodes the whole file into the analyzer and the views' gatherer; the
// frames read.
int64_t Stream(AudioReader* reader, apm::AudioAnalyzer* analyzer,
               BeatViewSignal* signal, const std::function<void(int)>& progress) {
  // Where the length is unknown, the analyzer cannot tell how far it is
  // (nor poll for Ctrl-C): the bytes read stand in.
  const bool length_known = reader->frames() >= 0;
  std::vector<int16_t> block(static_cast<size_t>(kBlockFrames) * reader->channels());
  int64_t frames = 0;
  for (int64_t got; !Interrupted() && (got = reader->Read(block.data(), kBlockFrames)) > 0;) {
    frames += got;
    if (!analyzer->Feed(block.data(), static_cast<int32_t>(got))) break;
    if (signal) signal->Add(block.data(), got);
    if (!length_known) {
      progress(static_cast<int>(kSpectrogramPercent * reader->fraction_read()));
    }
  }
  return frames;
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
  BeatResult result;
  result.path = path;
  AudioReader reader;
  if (!reader.Open(path, &result.error)) return result;
  result.sample_rate = reader.sample_rate();
  result.channels = reader.channels();
  const int64_t minimum_frames =
      static_cast<int64_t>(std::ceil(kMinimumSeconds * result.sample_rate));
  if (reader.frames() >= 0 && reader.frames() < minimum_frames) {
    result.error = reader.frames() == 0
                       ? "no audio (the file holds no samples)"
                       : TooShort(static_cast<double>(reader.frames()) / result.sample_rate);
    return result;
  }

  auto analyzer = std::make_unique<apm::AudioAnalyzer>(result.sample_rate, config);
  const auto analyzer_progress = [&](char byte) {
    progress(static_cast<unsigned char>(byte) * 100 / 99);
    return Interrupted();
  };
  if (!analyzer->Begin(result.channels, reader.frames(), analyzer_progress)) {
    result.error = "the analysis failed (see --verbose for its log)";
    return result;
  }
  std::unique_ptr<BeatViewSignal> signal;
  if (!extras.plot_path.empty() || !extras.html_path.empty()) {
    signal = std::make_unique<BeatViewSignal>(result.sample_rate, result.channels,
                                              !extras.html_path.empty());
  }
  const int64_t frames = Stream(&reader, analyzer.get(), signal.get(), progress);
  if (Interrupted()) {
    result.interrupted = true;
    return result;
  }
  result.duration = static_cast<double>(frames) / result.sample_rate;
  if (frames == 0) {
    result.error = "no audio (the file holds no samples)";
    return result;
  }
  if (frames < minimum_frames) {
    result.error = TooShort(result.duration);
    return result;
  }
  result.warning = reader.ShortfallWarning();
  const int32_t count = analyzer->Finish();
  // A cancelled tracking stage still returns a count (of 0).
  if (Interrupted()) {
    result.interrupted = true;
    return result;
  }
  if (count < 0) {
    result.error = "the analysis failed (see --verbose for its log)";
    return result;
  }
  const std::vector<double> times = TrueTimes(
      analyzer->beats(), count, analyzer->frames_per_second(), result.sample_rate);
  result.beats.assign(times.begin(), times.end());
  result.tempo = apm::PreciseTempo(times);
  if (count >= 2 && std::isfinite(analyzer->bpm()) && analyzer->bpm() > 0) {
    result.bpm = analyzer->bpm();
  }
  OnsetCurve onset;
  if (signal) {
    onset = {analyzer->detection_function(),
             apm::FrameRateAt(result.sample_rate).true_frames_per_second};
  }
  analyzer.reset();
  result.output_error = WriteExtras(extras, signal.get(), std::move(onset), result);
  if (Interrupted()) {
    result.interrupted = true;
    return result;
  }
  progress(100);
  return result;
}

}  // namespace cwtool
