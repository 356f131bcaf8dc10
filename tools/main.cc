// clipweaver: the library's beat analysis and resampler on sound files.
#include <cstdio>
#include <string>

#include "tools/beats_command.h"
#include "tools/command_line.h"
#include "tools/example_groove.h"
#include "tools/interrupt.h"
#include "tools/output_collisions.h"
#include "tools/resample_file.h"
#include "tools/text_escape.h"

namespace {

// Our messages only ever carry control characters inside file names.
void Say(const std::string& message) {
  fprintf(stderr, "clipweaver: %s\n", cwtool::TerminalText(message).c_str());
}

// After an error or Ctrl-C: what happened; nothing was left at the output.
int Finish(const std::string& error, const std::string& stopped) {
  if (cwtool::Interrupted()) {
    Say("interrupted: " + stopped + "; nothing written");
    return 130;
  }
  Say(error);
  return 1;
}

int Resample(const cwtool::ResampleSettings& settings) {
  const std::string collision =
      cwtool::FindCollision({settings.input}, {{settings.output, "output"}});
  if (!collision.empty()) {
    Say(collision);
    return 2;
  }
  int64_t frames = 0;
  std::string warning, error;
  const bool done = cwtool::ResampleFile(settings, &frames, &warning, &error);
  if (!warning.empty()) Say(settings.input + ": warning: " + warning + "; converted what is there");
  return done ? 0 : Finish(error, "resampling of " + settings.input + " stopped");
}

int Example(const std::string& path, const cwtool::GrooveSettings& settings) {
  std::string error;
  if (cwtool::WriteGroove(path, settings, &error)) return 0;
  return Finish(path + ": " + error, "writing of " + path + " stopped");
}

}  // namespace

int main(int argc, char** argv) {
  using cwtool::CommandLine;
  const CommandLine line = cwtool::ParseCommandLine(argc, argv);
  cwtool::InstallInterruptHandler();
  switch (line.action) {
    case CommandLine::Action::kHelp:
      printf("clipweaver %s: beat analysis, resampling and an example track\n\n%s",
             CLIPWEAVER_VERSION, cwtool::HelpText().c_str());
      return 0;
    case CommandLine::Action::kVersion:
      printf("clipweaver %s\n", CLIPWEAVER_VERSION);
      return 0;
    case CommandLine::Action::kUsageError:
      Say(line.error + " (see clipweaver --help)");
      return 2;
    case CommandLine::Action::kBeats:
      return cwtool::RunBeats(line.beats);
    case CommandLine::Action::kResample:
      return Resample(line.resample);
    case CommandLine::Action::kExample:
      return Example(line.example_path, line.example);
  }
  return 1;
}
