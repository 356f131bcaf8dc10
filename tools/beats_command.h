// The beats command: every file through the analysis on a few threads,
// results in the order of the arguments.
#ifndef CLIPWEAVER_TOOLS_BEATS_COMMAND_H_
#define CLIPWEAVER_TOOLS_BEATS_COMMAND_H_

#include "tools/command_line.h"

namespace cwtool {

// The exit status: 0, 1 when a file failed, 130 when interrupted.
int RunBeats(const BeatsOptions& options);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_BEATS_COMMAND_H_
