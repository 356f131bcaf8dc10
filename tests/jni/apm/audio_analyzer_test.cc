#include "jni/apm/audio_analyzer.h"

#include <gtest/gtest.h>

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "tests/test_signals.h"

namespace apm {
namespace {

std::vector<float> Conditioned(int32_t window, std::vector<float> x) {
  SubtractRunningMedian(window, &x);
  return x;
}

TEST(Conditioning, RunningMedianSeesRewrittenValuesOnItsLeft) {
  EXPECT_EQ(Conditioned(3, {10, 10, 10, 0}), (std::vector<float>{0, 0, 10, 0}));
  EXPECT_EQ(Conditioned(3, {0, 3, 1, 2}), (std::vector<float>{0, 2, 0, 0}));
  EXPECT_EQ(Conditioned(3, {0, 5}), (std::vector<float>{0, 0}));
  EXPECT_EQ(Conditioned(1, {4, 2, 9}), (std::vector<float>{0, 0, 0}));
  std::vector<float> spike(401, 0.0f);
  spike[200] = 3.5f;
  EXPECT_EQ(Conditioned(201, spike), spike);
  // A NaN later on leaves the values before it conditioned as ever.
  const std::vector<float> with_nan = Conditioned(3, {5, 1, 1, NAN});
  EXPECT_EQ(std::vector<float>(with_nan.begin(), with_nan.begin() + 2),
            (std::vector<float>{0, 0}));
}

// Against a selection over each window, on values with many ties, windows
// longer than the input and even lengths.
TEST(Conditioning, RunningMedianMatchesSelectionPerWindow) {
  uint32_t random = 5;
  for (const int32_t window : {1, 2, 3, 4, 7, 30, 201}) {
    for (const int n : {0, 1, 6, 90, 500}) {
      std::vector<float> x(n);
      for (float& v : x) {
        random = random * 1664525u + 1013904223u;
        v = static_cast<float>((random >> 16) % 7) - 2.0f;
      }
      std::vector<float> expected = x;
      const int half = window / 2;
      for (int i = 0; i < n; ++i) {
        std::vector<float> w(expected.begin() + std::max(i - half, 0),
                             expected.begin() + std::min(i + half + 1, n));
        std::nth_element(w.begin(), w.begin() + w.size() / 2, w.end());
        expected[i] = std::max(expected[i] - w[w.size() / 2], 0.0f);
      }
      EXPECT_EQ(Conditioned(window, x), expected) << window << " " << n;
    }
  }
}

TEST(Conditioning, NormalisationScalesToOneAndRefusesFlatInput) {
  std::vector<float> x = {0, 0, 10, 0};
  EXPECT_TRUE(NormalizeDetectionFunction(&x));
  EXPECT_EQ(x, (std::vector<float>{0, 0, 1, 0}));
  x = {1, 4, 4};
  EXPECT_TRUE(NormalizeDetectionFunction(&x));
  EXPECT_EQ(x, (std::vector<float>{0.5f, 1, 1}));
  for (std::vector<float> flat : {std::vector<float>{0, 0, 0}, std::vector<float>{},
                                  std::vector<float>{0, INFINITY}}) {
    const std::vector<float> before = flat;
    EXPECT_FALSE(NormalizeDetectionFunction(&flat));
    EXPECT_EQ(flat, before);
  }
}

struct Outcome {
  int32_t count;
  std::vector<int> progress;
  std::vector<float> beats;
  std::string log;
};

// One run over the first size bytes by `reused` or a fresh analyzer: in one call, or, when
// block > 0, fed in blocks of that many frames after announcing the given frame count.
Outcome Analyze(const std::vector<int16_t>& pcm, int32_t size, int rate, int channels,
                int cancel_at = 1000, int32_t block = 0, int64_t announced = 0,
                AudioAnalyzer* reused = nullptr) {
  Outcome run;
  AudioAnalyzer fresh(rate);
  AudioAnalyzer& analyzer = reused ? *reused : fresh;
  const auto progress = [&](char p) {
    run.progress.push_back(p);
    return p >= cancel_at;
  };
  testing::internal::CaptureStderr();
  if (block == 0) {
    run.count = analyzer.CalculateBeats(reinterpret_cast<const uint8_t*>(pcm.data()), size,
                                        channels, progress);
  } else {
    const int32_t frames = size / 2 / channels;
    EXPECT_TRUE(analyzer.Begin(channels, announced, progress));
    for (int32_t first = 0; first < frames; first += block) {
      EXPECT_TRUE(analyzer.Feed(&pcm[static_cast<size_t>(first) * channels],
                                std::min(block, frames - first)));
    }
    run.count = analyzer.Finish();
  }
  run.log = testing::internal::GetCapturedStderr();
  if (run.count > 0) run.beats.assign(analyzer.beats(), analyzer.beats() + run.count);
  return run;
}

int32_t Bytes(const std::vector<int16_t>& pcm) { return static_cast<int32_t>(2 * pcm.size()); }

TEST(AudioAnalyzer, StreamedBlocksGiveTheWholeBufferRun) {
  const int rate = 22050;
  const std::vector<int16_t> pcm = test_signals::Clicks(rate, 2, 20, 0.5);
  const int64_t frames = static_cast<int64_t>(pcm.size() / 2);
  const Outcome whole = Analyze(pcm, Bytes(pcm), rate, 2);
  ASSERT_GT(whole.count, 30);
  for (int32_t block : {1, 7, 441, 4096, 65536}) {
    const Outcome run = Analyze(pcm, Bytes(pcm), rate, 2, 1000, block, frames);
    EXPECT_EQ(run.count, whole.count) << block;
    EXPECT_EQ(run.beats, whole.beats) << block;
    EXPECT_EQ(run.progress, whole.progress) << block;
    EXPECT_EQ(run.log, whole.log) << block;
  }
  // A wrong or unknown length only moves the progress bytes, never backwards.
  for (int64_t announced : {frames / 3, 3 * frames, int64_t{-1}}) {
    const Outcome run = Analyze(pcm, Bytes(pcm), rate, 2, 1000, 4096, announced);
    EXPECT_EQ(run.beats, whole.beats) << announced;
    EXPECT_TRUE(std::is_sorted(run.progress.begin(), run.progress.end())) << announced;
    EXPECT_LE(run.progress.back(), 98);
  }
  // Nothing fed after an unknown length: nothing to analyse.
  const Outcome empty = Analyze({}, 0, rate, 2, 1000, 4096, -1);
  EXPECT_EQ(empty.count, -1);
  EXPECT_NE(empty.log.find(" Input samples size: 0\n"), std::string::npos);
  EXPECT_EQ(empty.log.find("Onset"), std::string::npos);
}

TEST(AudioAnalyzer, ProgressFailuresAndCancellation) {
  const std::vector<int16_t> pcm = test_signals::Clicks(8000, 3, 3, 0.5);
  const int32_t size = Bytes(pcm);
  const struct {
    int32_t size, channels, cancel_at, count;
    std::vector<int> progress;
    const char* log;
  } rows[] = {
      {size, 0, 1000, -1, {}, " Channels are less than one!\n"},
      {-10, 3, 1000, -1, {}, " Input samples size: 0\n"},
      // Ten bytes of stereo are two frames; the last two bytes are ignored.
      {10, 2, 1000, -1, {}, " Input samples size: 2\n"},
      {size, 3, 0, -1, {0}, "Spectrogram process failed!"},
      {size, 3, 33, -1, {0, 11, 22, 33}, "Onset process failed!"},
      // Each stage starts at its third of the bytes: every 100 of 299 frames
      // in the first two, every 500 in the tracker.
      {size, 3, 66, 0, {0, 11, 22, 33, 44, 55, 66}, "Estimated BPM = 0\n"},
  };
  for (const auto& row : rows) {
    const Outcome run = Analyze(pcm, row.size, 8000, row.channels, row.cancel_at);
    EXPECT_EQ(run.count, row.count) << row.log;
    EXPECT_EQ(run.progress, row.progress) << row.log;
    EXPECT_NE(run.log.find(row.log), std::string::npos) << row.log;
  }
}

// The input ends where an unreadable page begins, so that a read past its
// last frame faults instead of passing unseen.
TEST(AudioAnalyzer, ReadsNothingPastTheInput) {
  const size_t page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  for (int channels : {1, 2, 3}) {
    const std::vector<int16_t> pcm = test_signals::Clicks(8000, channels, 3, 0.5);
    const size_t bytes = 2 * pcm.size();
    const size_t span = (bytes + page - 1) / page * page;
    void* pages = mmap(nullptr, span + page, PROT_READ | PROT_WRITE,
                       MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(pages, MAP_FAILED);
    uint8_t* end = static_cast<uint8_t*>(pages) + span;
    ASSERT_EQ(mprotect(end, page, PROT_NONE), 0);
    std::memcpy(end - bytes, pcm.data(), bytes);
    AudioAnalyzer analyzer(8000);
    testing::internal::CaptureStderr();
    const int32_t count = analyzer.CalculateBeats(end - bytes, static_cast<int32_t>(bytes),
                                                  channels, [](char) { return false; });
    testing::internal::GetCapturedStderr();
    EXPECT_EQ(std::vector<float>(analyzer.beats(), analyzer.beats() + count),
              Analyze(pcm, Bytes(pcm), 8000, channels).beats) << channels;
    munmap(pages, span + page);
  }
}

// Stopped at its second progress report, a run ignores later blocks, and
// the next run on the same analyzer gives what a fresh one gives.
TEST(AudioAnalyzer, AStoppedRunIgnoresLaterBlocksAndLeavesTheAnalyzerReady) {
  const std::vector<int16_t> pcm = test_signals::Clicks(8000, 2, 3, 0.5);
  const int32_t frames = static_cast<int32_t>(pcm.size() / 2);
  int calls = 0;
  AudioAnalyzer analyzer(8000);
  testing::internal::CaptureStderr();
  ASSERT_TRUE(analyzer.Begin(2, frames, [&calls](char) { return calls++ == 1; }));
  EXPECT_FALSE(analyzer.Feed(pcm.data(), frames));
  EXPECT_FALSE(analyzer.Feed(pcm.data(), frames));
  EXPECT_EQ(analyzer.Finish(), -1);
  EXPECT_EQ(calls, 2);
  testing::internal::GetCapturedStderr();
  const Outcome again = Analyze(pcm, Bytes(pcm), 8000, 2, 1000, 0, 0, &analyzer);
  const Outcome fresh = Analyze(pcm, Bytes(pcm), 8000, 2);
  EXPECT_EQ(again.progress, fresh.progress);
  EXPECT_EQ(again.beats, fresh.beats);
}

}  // namespace
}  // namespace apm
