// What the user asked for, parsed and checked, with the usage text.
#ifndef CLIPWEAVER_TOOLS_COMMAND_LINE_H_
#define CLIPWEAVER_TOOLS_COMMAND_LINE_H_

#include <string>
#include <vector>

#include "tools/example_groove.h"
#include "tools/report.h"
#include "tools/resample_file.h"
#include "tools/tempo_option.h"

namespace cwtool {

struct BeatsOptions {
  std::vector<std::string> files;
  ReportFormat format = ReportFormat::kText;
  int jobs = 0;  // 0: one per core
  bool quiet = false;
  bool verbose = false;
  // Output paths; with several files "{}" stands for each input's name
  // without directory and extension.
  std::string click_pattern;
  std::string plot_pattern;
  std::string html_pattern;
  TempoRangeOption tempo;  // not given: the tracker's own range
};

struct CommandLine {
  enum class Action { kHelp, kVersion, kBeats, kResample, kExample, kUsageError };
  Action action = Action::kUsageError;
  std::string error;  // for kUsageError
  BeatsOptions beats;
  ResampleSettings resample;
  GrooveSettings example;
  std::string example_path;
};

CommandLine ParseCommandLine(int argc, const char* const* argv);

// pattern with "{}" replaced by the input's file name without directory and
// extension.
std::string OutputName(const std::string& pattern, const std::string& input);

std::string HelpText();

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_COMMAND_LINE_H_
