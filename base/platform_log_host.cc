// Host stand-in for the platform log service.
#include <cstdarg>
#include <cstdio>
#include <cstdlib>

#include "base/platform_log.h"

namespace platform_log {

void Write(int, const char*, const char*) {}

void Print(int priority, const char* tag, const char* format, ...) {
  char text[1024];
  va_list args;
  va_start(args, format);
  vsnprintf(text, sizeof(text), format, args);
  va_end(args);
  char line[1100];
  snprintf(line, sizeof(line), "%s : %s\n", tag, text);
  EmitStderrLine(priority, line);
}

void Assert(const char* condition, const char* tag, const char* format, ...) {
  char text[1024];
  va_list args;
  va_start(args, format);
  vsnprintf(text, sizeof(text), format, args);
  va_end(args);
  char line[1400];
  snprintf(line, sizeof(line), "%s : %s (%s)\n", tag, text, condition);
  EmitStderrLine(kFatal, line);
  abort();
}

}  // namespace platform_log
