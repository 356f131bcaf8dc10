// A picture of one analysis: the waveform envelope, the conditioned onset
// function and the beats, with the tempo in the title.
#ifndef CLIPWEAVER_TOOLS_SVG_PLOT_H_
#define CLIPWEAVER_TOOLS_SVG_PLOT_H_

#include <cstdint>
#include <string>
#include <vector>

#include "tools/audio_file.h"

namespace cwtool {

struct BeatPlot {
  std::string name;
  const DecodedAudio* audio;
  const std::vector<float>* onset;  // one value per analysis frame
  double frames_per_second;
  const std::vector<float>* beats;  // seconds
  double bpm;                       // 0: unknown
};

std::string BeatPlotSvg(const BeatPlot& plot);
bool WriteBeatPlot(const std::string& path, const BeatPlot& plot,
                   std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_SVG_PLOT_H_
