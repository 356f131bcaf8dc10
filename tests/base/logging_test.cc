#include "base/logging.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <string>

#include "base/platform_log.h"

namespace {

std::string Captured(void (*statement)()) {
  testing::internal::CaptureStderr();
  statement();
  return testing::internal::GetCapturedStderr();
}

// One line per statement, streamed as a default ostream would, leaving errno
// as it was.
TEST(Logging, OneLinePerStatementWithFileLineAndPlainFormatting) {
  const int line = __LINE__ + 3;
  const std::string log = Captured([] {
    errno = EAGAIN;
    LOG(ERROR) << "Gets " << 212 << " beats " << 119.8828125 << " " << 100.0 << " " << 1e-5 << " "
               << -7 << " " << std::hex << 255;
    EXPECT_EQ(errno, EAGAIN);
  });
  EXPECT_EQ(log, "native : logging_test.cc:" + std::to_string(line) +
                     " Gets 212 beats 119.883 100 1e-05 -7 0xff\n");
  EXPECT_STREQ(base_logging::LogMessage::FileName("audio.src"), "audio.src");
  EXPECT_STREQ(base_logging::LogMessage::FileName("a/b/apm.cc"), "apm.cc");
}

std::string sunk;

TEST(Logging, SinkTakesTheStderrLinesWithTheirPriority) {
  platform_log::SetStderrSink(
      [](int priority, const char* line) { sunk += std::to_string(priority) + "|" + line; });
  const int line = __LINE__ + 2;
  const std::string log = Captured([] {
    LOG(WARNING) << "w";
    platform_log::Print(6, "Tag", "%d", 7);
  });
  platform_log::SetStderrSink(nullptr);
  EXPECT_EQ(log, "");
  EXPECT_EQ(sunk, "5|native : logging_test.cc:" + std::to_string(line) + " w\n6|Tag : 7\n");
  EXPECT_EQ(Captured([] { LOG(INFO) << "back"; }).substr(0, 9), "native : ");
}

TEST(LoggingDeathTest, FailedCheckAndFatalAbort) {
  int* output = nullptr;
  EXPECT_DEATH(CHECK(output) << "extra",
               "native : logging_test.cc:[0-9]+ Check failed: output extra\n");
  EXPECT_DEATH(LOG(FATAL) << "stop", "logging_test.cc:[0-9]+ stop");
  EXPECT_EQ(Captured([] { CHECK(errno >= 0) << "a holding condition logs nothing"; }), "");
}

}  // namespace
