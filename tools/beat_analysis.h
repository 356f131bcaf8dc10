// One file through the beat analysis: decoding, the checks that give clear
// reasons for unusable input, the analysis itself and the optional click
// track, plot and page.
#ifndef CLIPWEAVER_TOOLS_BEAT_ANALYSIS_H_
#define CLIPWEAVER_TOOLS_BEAT_ANALYSIS_H_

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

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
  double bpm = 0;       // 0: unknown (fewer than two beats)
  std::vector<float> beats;
  // A click track, plot or page that could not be written; the result stands.
  std::string output_error;
};

struct ExtraOutputs {
  std::string click_path;  // empty: none
  std::string plot_path;
  std::string html_path;
};

// progress gets 0..100 percent. Stops early, with `interrupted` set and no
// extra output left behind, once Ctrl-C has been pressed.
BeatResult AnalyseFile(const std::string& path, const ExtraOutputs& extras,
                       const std::function<void(int)>& progress);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_BEAT_ANALYSIS_H_
