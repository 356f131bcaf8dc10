#include "base/logging.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "base/platform_log.h"

namespace base_logging {
namespace {

constexpr const char kTag[] = "native";

int PlatformPriority(LogSeverity severity) {
  switch (severity) {
    case INFO:
      return platform_log::kInfo;
    case WARNING:
      return platform_log::kWarning;
    case ERROR:
      return platform_log::kError;
    case FATAL:
      return platform_log::kFatal;
  }
  return platform_log::kFatal;
}

}  // namespace

MessageStreamBuffer::int_type MessageStreamBuffer::overflow(int_type c) {
  if (!traits_type::eq_int_type(c, traits_type::eof())) {
    text_.push_back(traits_type::to_char_type(c));
  }
  return traits_type::not_eof(c);
}

std::streamsize MessageStreamBuffer::xsputn(const char* s, std::streamsize n) {
  text_.append(s, static_cast<size_t>(n));
  return n;
}

const char* LogMessage::FileName(const char* path) {
  const char* slash = strrchr(path, '/');
  return slash != nullptr ? slash + 1 : path;
}

LogMessage::LogMessage(const char* file, int line, LogSeverity severity)
    : saved_errno_(errno),
      file_name_(FileName(file)),
      line_(line),
      severity_(severity),
      stream_(&buffer_) {
  stream_.setf(std::ios_base::showbase);
}

LogMessage::~LogMessage() {
  std::string line = file_name_;
  line += ':';
  line += std::to_string(line_);
  line += ' ';
  line += buffer_.text();
  line += '\n';

  const int priority = PlatformPriority(severity_);
  platform_log::Write(priority, kTag, line.c_str());
  platform_log::EmitStderrLine(priority, (std::string(kTag) + " : " + line).c_str());
  if (severity_ == FATAL) {
    platform_log::Write(platform_log::kFatal, kTag, "terminating.\n");
    abort();
  }
  errno = saved_errno_;
}

}  // namespace base_logging
