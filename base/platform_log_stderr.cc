#include <atomic>
#include <cstdio>

#include "base/platform_log.h"

namespace platform_log {
namespace {

std::atomic<StderrSink> current_sink{&WriteToStderr};

}  // namespace

void SetStderrSink(StderrSink sink) {
  current_sink.store(sink != nullptr ? sink : &WriteToStderr);
}

void WriteToStderr(int, const char* line) {
  // One call per line: stderr is unbuffered, so each line is one write and
  // lines of concurrent threads do not interleave.
  fputs(line, stderr);
}

void EmitStderrLine(int priority, const char* line) {
  current_sink.load()(priority, line);
}

}  // namespace platform_log
