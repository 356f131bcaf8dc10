// Host stand-in for the platform log service.
#include <cstdarg>
#include <cstdio>
#include <cstdlib>

#include "base/platform_log.h"

namespace platform_log {

void Write(int, const char*, const char*) {}

void Print(int, const char* tag, const char* format, ...) {
  char text[1024];
  va_list args;
  va_start(args, format);
  vsnprintf(text, sizeof(text), format, args);
  va_end(args);
  fprintf(stderr, "%s : %s\n", tag, text);
}

void Assert(const char* condition, const char* tag, const char* format, ...) {
  char text[1024];
  va_list args;
  va_start(args, format);
  vsnprintf(text, sizeof(text), format, args);
  va_end(args);
  fprintf(stderr, "%s : %s (%s)\n", tag, text, condition);
  abort();
}

}  // namespace platform_log
