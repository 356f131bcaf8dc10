// The platform log service: Android's liblog on the device, a stand-in on
// the host. Every native log line of the library passes through here.
#ifndef CLIPWEAVER_BASE_PLATFORM_LOG_H_
#define CLIPWEAVER_BASE_PLATFORM_LOG_H_

namespace platform_log {

enum Priority {
  kInfo = 4,
  kWarning = 5,
  kError = 6,
  kFatal = 7,
};

// One complete entry. On the host this writes nothing: the log facility
// already mirrors each of its lines to stderr, and a second copy there would
// only duplicate it.
void Write(int priority, const char* tag, const char* text);

// printf-style entry for code that logs without the log facility (the
// resampler). On the host it goes to stderr as "tag : text".
void Print(int priority, const char* tag, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

// Logs at fatal priority and ends the process.
[[noreturn]] void Assert(const char* condition, const char* tag,
                         const char* format, ...)
    __attribute__((format(printf, 3, 4)));

}  // namespace platform_log

#endif  // CLIPWEAVER_BASE_PLATFORM_LOG_H_
