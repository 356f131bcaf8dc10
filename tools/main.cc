// clipweaver: the library's beat analysis and resampler on sound files.
#include <cstdio>
#include <string>

#include "tools/beats_command.h"
#include "tools/command_line.h"
#include "tools/example_groove.h"
#include "tools/resample_file.h"

namespace {

int Fail(const std::string& message) {
  fprintf(stderr, "clipweaver: %s\n", message.c_str());
  return 1;
}

}  // namespace

int main(int argc, char** argv) {
  using cwtool::CommandLine;
  const CommandLine line = cwtool::ParseCommandLine(argc, argv);
  switch (line.action) {
    case CommandLine::Action::kHelp:
      printf("clipweaver %s: beat analysis, resampling and an example track\n\n%s",
             CLIPWEAVER_VERSION, cwtool::HelpText());
      return 0;
    case CommandLine::Action::kVersion:
      printf("clipweaver %s\n", CLIPWEAVER_VERSION);
      return 0;
    case CommandLine::Action::kUsageError:
      fprintf(stderr, "clipweaver: %s (see clipweaver --help)\n", line.error.c_str());
      return 2;
    case CommandLine::Action::kBeats:
      return cwtool::RunBeats(line.beats);
    case CommandLine::Action::kResample: {
      int64_t frames = 0;
      std::string error;
      if (!cwtool::ResampleFile(line.resample, &frames, &error)) return Fail(error);
      return 0;
    }
    case CommandLine::Action::kExample: {
      std::string error;
      if (!cwtool::WriteGroove(line.example_path, line.example, &error)) {
        return Fail(line.example_path + ": " + error);
      }
      return 0;
    }
  }
  return 1;
}
