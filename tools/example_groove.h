// The project's example track: a drum groove at a known tempo, with a kick
// on every beat, a snare on beats 2 and 4 and a hi-hat on every off-beat.
// Every sample is a pure function of its frame number (the noise comes
// from a hash), so the track is the same on every machine and any block
// can be rendered on its own.
#ifndef CLIPWEAVER_TOOLS_EXAMPLE_GROOVE_H_
#define CLIPWEAVER_TOOLS_EXAMPLE_GROOVE_H_

#include <cstdint>
#include <string>

namespace cwtool {

struct GrooveSettings {
  double bpm = 120;
  double seconds = 20;
  int32_t sample_rate = 44100;
  int32_t channels = 2;  // 1 or 2
};

int64_t GrooveFrames(const GrooveSettings& settings);

// count interleaved frames starting at frame `first`.
void RenderGroove(const GrooveSettings& settings, int64_t first, int32_t count,
                  int16_t* out);

// The container follows the extension of path. Stops, writing nothing, on
// Ctrl-C.
bool WriteGroove(const std::string& path, const GrooveSettings& settings,
                 std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_EXAMPLE_GROOVE_H_
