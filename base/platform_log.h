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

// Where the lines meant for stderr go: each arrives finished, newline
// included. Programs that link the library directly (the tool, fuzzers) set
// their own to keep the lines off their terminal; the JVM's library never
// does, so there every line reaches stderr. Callable from any thread; lines
// already being written may still take the old sink.
using StderrSink = void (*)(int priority, const char* line);
void SetStderrSink(StderrSink sink);
// The initial sink.
void WriteToStderr(int priority, const char* line);
// Hands one line to the current sink.
void EmitStderrLine(int priority, const char* line);

}  // namespace platform_log

#endif  // CLIPWEAVER_BASE_PLATFORM_LOG_H_
