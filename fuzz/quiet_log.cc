// Linked into every fuzzer: the library's lines would cost more than the
// runs they describe, and flood the log. Fatal lines stay, as they explain
// the crash that follows.
#include "base/platform_log.h"

namespace {

void KeepFatal(int priority, const char* line) {
  if (priority >= platform_log::kFatal) platform_log::WriteToStderr(priority, line);
}

[[maybe_unused]] const bool kInstalled = (platform_log::SetStderrSink(&KeepFatal), true);

}  // namespace
