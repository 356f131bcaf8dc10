// One file through the beat analysis: decoding, the checks that give clear
// reasons for unusable input, the analysis itself and the optional click
// track, plot and page.
#ifndef CLIPWEAVER_TOOLS_BEAT_ANALYSIS_H_
#define CLIPWEAVER_TOOLS_BEAT_ANALYSIS_H_

#include <cstdint>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "jni/apm/apm.h"

namespace cwtool {

// Shorter input cannot show two beats at the slowest tempo tracked.
constexpr double kMinimumSeconds = 1.0;

struct BeatResult {
  std::string path;
  std::string error;  // why there is no result; empty on success
  bool interrupted = false;
  std::string warning;  // the result stands, with this said about the input
  int32_t sample_rate = 0;
  int32_t channels = 0;
  double duration = 0;  // seconds
  // The tracker's figure, 60 over its median beat interval, in whole
  // frames; 0: unknown (fewer than two beats).
  double bpm = 0;
  // The precise tempo of the beats; NaN: unknown.
  double tempo = std::numeric_limits<double>::quiet_NaN();
  std::vector<float> beats;
  // A click track, plot or page that could not be written; the result stands.
  std::string output_error;
};

struct ExtraOutputs {
  std::string click_path;  // empty: none
  std::string plot_path;
  std::string html_path;
};

// Beat times are in true seconds: frames are counted at the sample rate
// over the analysis step, not at the whole frames per second the library's
// times assume. progress gets 0..100 percent. Stops early, with
// `interrupted` set, once Ctrl-C has been pressed.
BeatResult AnalyseFile(const std::string& path, const apm::ApmConfig& config,
                       const ExtraOutputs& extras,
                       const std::function<void(int)>& progress);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_BEAT_ANALYSIS_H_
