// An hour of stereo clicks at 120 BPM, streamed a minute at a time: the
// analysis keeps the tempo from start to end, and its peak memory grows by
// less than 4 KiB per second of audio.
#include <gtest/gtest.h>
#include <sys/resource.h>

#include <algorithm>
#include <vector>

#include "jni/apm/audio_analyzer.h"
#include "tests/test_signals.h"

namespace {

constexpr int kRate = 44100;
constexpr int kSeconds = 3600;

long PeakKib() {
  rusage usage;
  getrusage(RUSAGE_SELF, &usage);
  return usage.ru_maxrss;
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
  const long before = PeakKib();
  apm::AudioAnalyzer analyzer(kRate);
  testing::internal::CaptureStderr();
  ASSERT_TRUE(analyzer.Begin(2, int64_t{kRate} * kSeconds, nullptr));
  for (int m = 0; m < kSeconds / 60; ++m) analyzer.Feed(minute.data(), kRate * 60);
  const int32_t n = analyzer.Finish();
  testing::internal::GetCapturedStderr();
  const long grown_kib = PeakKib() - before;

  ASSERT_NEAR(n, 2 * kSeconds, 20);
  EXPECT_NEAR(MedianInterval(analyzer.beats(), 0, 600), 0.5, 0.005);
  EXPECT_NEAR(MedianInterval(analyzer.beats(), n - 600, n), 0.5, 0.005);
  EXPECT_GT(analyzer.beats()[n - 1], kSeconds - 2);
  EXPECT_LT(grown_kib, 4 * kSeconds) << grown_kib / 1024 << " MiB";
}

}  // namespace
