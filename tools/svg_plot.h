// A picture of one analysis: the whole track in a strip on top, then the
// track in rows of ten seconds with waveform, onset strength and beats, so
// that each beat can be told from its neighbours.
#ifndef CLIPWEAVER_TOOLS_SVG_PLOT_H_
#define CLIPWEAVER_TOOLS_SVG_PLOT_H_

#include <string>

#include "tools/beat_view.h"

namespace cwtool {

// On failure *error says why, and nothing is left under path.
bool WriteBeatPlot(const std::string& path, const BeatView& view, std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_SVG_PLOT_H_
