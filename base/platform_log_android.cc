#include <android/log.h>

#include <cstdarg>
#include <cstdio>

#include "base/platform_log.h"

namespace platform_log {

void Write(int priority, const char* tag, const char* text) {
  __android_log_write(priority, tag, text);
}

void Print(int priority, const char* tag, const char* format, ...) {
  va_list args;
  va_start(args, format);
  __android_log_vprint(priority, tag, format, args);
  va_end(args);
}

void Assert(const char* condition, const char* tag, const char* format, ...) {
  char text[512];
  va_list args;
  va_start(args, format);
  vsnprintf(text, sizeof(text), format, args);
  va_end(args);
  __android_log_assert(condition, tag, "%s", text);
}

}  // namespace platform_log
