// The beats command's --tempo MIN-MAX: its parsing and its check against
// the frame rate of every input.
#ifndef CLIPWEAVER_TOOLS_TEMPO_OPTION_H_
#define CLIPWEAVER_TOOLS_TEMPO_OPTION_H_

#include <string>
#include <vector>

namespace cwtool {

struct TempoRangeOption {
  bool given = false;
  double min_bpm = 0;
  double max_bpm = 0;
};

// Empty on success; the frame-rate check waits for the files.
std::string ParseTempoRange(const std::string& text, TempoRangeOption* range);

// The first input the range is too narrow for, as "FILE: reason"; empty
// when it suits them all. Inputs that do not open are left to the analysis
// to report.
std::string CheckTempoRangeForFiles(const TempoRangeOption& range,
                                    const std::vector<std::string>& files);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_TEMPO_OPTION_H_
