// The input with a short click on every beat, to check the beats by ear.
#ifndef CLIPWEAVER_TOOLS_CLICK_TRACK_H_
#define CLIPWEAVER_TOOLS_CLICK_TRACK_H_

#include <string>
#include <vector>

namespace cwtool {

// A second pass over the input file, block by block; same rate and channels
// as the input, the container following the extension of path. Stops,
// writing nothing, on Ctrl-C.
bool WriteClickTrack(const std::string& path, const std::string& input,
                     const std::vector<float>& beats, std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_CLICK_TRACK_H_
