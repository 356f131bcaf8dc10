// Sample-rate conversion of a whole file through the library's linear
// resampler, block by block, so memory stays the same for any length.
#ifndef CLIPWEAVER_TOOLS_RESAMPLE_FILE_H_
#define CLIPWEAVER_TOOLS_RESAMPLE_FILE_H_

#include <cstdint>
#include <string>

namespace cwtool {

struct ResampleSettings {
  std::string input;
  std::string output;
  int32_t rate = 0;
  float left_gain = 1.0f;  // the only gain for mono files
  float right_gain = 1.0f;
};

// On failure *error names the file at fault and the reason; after Ctrl-C
// it stays empty. Nothing appears at the output unless the whole input was
// converted. *warning tells of an input shorter than its header announced.
bool ResampleFile(const ResampleSettings& settings, int64_t* frames_written,
                  std::string* warning, std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_RESAMPLE_FILE_H_
