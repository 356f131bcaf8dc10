// The library's log facility.
//
//   LOG(INFO) << "Input samples size: " << n;
//   CHECK(output != nullptr) << "more text";
//
// A statement becomes one line "file:line text" (file = the source file's
// name without directories), written to the platform log with the tag
// "native" and to stderr as "native : file:line text" (through the sink of
// platform_log.h). errno is the same after a statement as before it. FATAL
// statements, and so failed CHECKs, log "terminating." and abort; they never
// return.
#ifndef CLIPWEAVER_BASE_LOGGING_H_
#define CLIPWEAVER_BASE_LOGGING_H_

#include <ostream>
#include <streambuf>
#include <string>

namespace base_logging {

enum LogSeverity {
  INFO = 0,
  WARNING = 1,
  ERROR = 2,
  FATAL = 3,
};

// Appends everything streamed into it to a string, so a message has no
// length limit.
class MessageStreamBuffer : public std::streambuf {
 public:
  const std::string& text() const { return text_; }

 protected:
  int_type overflow(int_type c) override;
  std::streamsize xsputn(const char* s, std::streamsize n) override;

 private:
  std::string text_;
};

class LogMessage {
 public:
  LogMessage(const char* file, int line, LogSeverity severity);
  ~LogMessage();
  LogMessage(const LogMessage&) = delete;
  LogMessage& operator=(const LogMessage&) = delete;

  std::ostream& stream() { return stream_; }

  // The file part of a path: what follows its last '/'.
  static const char* FileName(const char* path);

 private:
  int saved_errno_;
  const char* file_name_;
  int line_;
  LogSeverity severity_;
  MessageStreamBuffer buffer_;
  std::ostream stream_;
};

// Turns the stream expression of CHECK into void so that it can stand in
// the conditional operator.
struct LogMessageVoidify {
  void operator&(std::ostream&) {}
};

}  // namespace base_logging

#define LOG(severity)                                  \
  ::base_logging::LogMessage(__FILE__, __LINE__,       \
                             ::base_logging::severity) \
      .stream()

#define CHECK(condition)                    \
  (condition) ? (void)0                     \
              : ::base_logging::LogMessageVoidify() & \
                    LOG(FATAL) << "Check failed: " #condition " "

#endif  // CLIPWEAVER_BASE_LOGGING_H_
