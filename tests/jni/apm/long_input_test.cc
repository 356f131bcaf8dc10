// An hour of stereo audio at a known tempo: the analysis finishes, keeps the
// tempo from start to end, and its memory grows no faster than the bound of
// 60 KiB per second of audio.
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <vector>

#include "jni/apm/audio_analyzer.h"

namespace {

constexpr int kRate = 44100;
constexpr int kSeconds = 3600;

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
  // Integer-only clicks every half second over low noise.
  std::vector<int16_t> pcm(static_cast<size_t>(kRate) * kSeconds * 2);
  uint32_t noise = 1;
  for (size_t i = 0; i < pcm.size() / 2; ++i) {
    noise = noise * 1664525u + 1013904223u;
    const size_t since = i % (kRate / 2);
    int v = static_cast<int>(noise >> 23) - 256;
    if (since < 400) v += static_cast<int>((since % 40) * 800) - 16000;
    pcm[2 * i] = pcm[2 * i + 1] = static_cast<int16_t>(v);
  }
  const double before = ResidentKib();
  apm::AudioAnalyzer analyzer(kRate);
  testing::internal::CaptureStderr();
  const int32_t n = analyzer.CalculateBeats(reinterpret_cast<const uint8_t*>(pcm.data()),
                                            static_cast<int32_t>(pcm.size() * 2), 2,
                                            [](char) { return false; });
  testing::internal::GetCapturedStderr();
  rusage usage;
  getrusage(RUSAGE_SELF, &usage);
  const double native_kib = usage.ru_maxrss - before;

  ASSERT_NEAR(n, 2 * kSeconds, 20);
  EXPECT_NEAR(MedianInterval(analyzer.beats(), 0, 600), 0.5, 0.005);
  EXPECT_NEAR(MedianInterval(analyzer.beats(), n - 600, n), 0.5, 0.005);
  EXPECT_GT(analyzer.beats()[n - 1], kSeconds - 2);
  EXPECT_LT(native_kib, 60.0 * kSeconds) << native_kib / 1024 << " MiB";
}

}  // namespace
