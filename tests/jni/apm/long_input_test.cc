// An hour of stereo clicks at 120 BPM, streamed a minute at a time: the
// analysis keeps the tempo from start to end, and its memory grows by less
// than 4 KiB per second of audio.
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <vector>

#include "jni/apm/audio_analyzer.h"
#include "tests/test_signals.h"

namespace {

constexpr int kRate = 44100;
constexpr int kMinutes = 60;

double ResidentKib() {
  long pages = 0, resident = 0;
  FILE* statm = fopen("/proc/self/statm", "r");
  if (statm == nullptr || fscanf(statm, "%ld %ld", &pages, &resident) != 2) return 0;
  fclose(statm);
  return resident * (sysconf(_SC_PAGESIZE) / 1024.0);
}

double MedianInterval(const float* beats, int first, int last) {
  std::vector<float> intervals;
  for (int i = first + 1; i < last; ++i) intervals.push_back(beats[i] - beats[i - 1]);
  std::nth_element(intervals.begin(), intervals.begin() + intervals.size() / 2, intervals.end());
  return intervals[intervals.size() / 2];
}

TEST(LongInput, AnHourAt120BeatsPerMinute) {
  // A minute holds a whole number of beats, so the minutes join seamlessly.
  const std::vector<int16_t> minute = test_signals::Clicks(kRate, 2, 60, 0.5);
  const double before = ResidentKib();
  apm::AudioAnalyzer analyzer(kRate);
  testing::internal::CaptureStderr();
  ASSERT_TRUE(analyzer.Begin(2, int64_t{kRate} * 60 * kMinutes, nullptr));
  for (int m = 0; m < kMinutes; ++m) analyzer.Feed(minute.data(), kRate * 60);
  const int32_t n = analyzer.Finish();
  testing::internal::GetCapturedStderr();
  rusage usage;
  getrusage(RUSAGE_SELF, &usage);
  const double native_kib = usage.ru_maxrss - before;

  const int seconds = 60 * kMinutes;
  ASSERT_NEAR(n, 2 * seconds, 20);
  EXPECT_NEAR(MedianInterval(analyzer.beats(), 0, 600), 0.5, 0.005);
  EXPECT_NEAR(MedianInterval(analyzer.beats(), n - 600, n), 0.5, 0.005);
  EXPECT_GT(analyzer.beats()[n - 1], seconds - 2);
  EXPECT_LT(native_kib, 4.0 * seconds) << native_kib / 1024 << " MiB";
}

}  // namespace
