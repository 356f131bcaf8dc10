#include "jni/apm/audio_analyzer.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <string>
#include <utility>
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

Outcome Finished(AudioAnalyzer* analyzer, int32_t count, Outcome run) {
  run.count = count;
  run.log = testing::internal::GetCapturedStderr();
  if (count > 0) run.beats.assign(analyzer->beats(), analyzer->beats() + count);
  return run;
}

// The whole-buffer call on the first size bytes.
Outcome Analyze(const std::vector<int16_t>& pcm, int32_t size, int rate, int channels,
                int cancel_at = 1000) {
  Outcome run;
  AudioAnalyzer analyzer(rate);
  testing::internal::CaptureStderr();
  const int32_t count = analyzer.CalculateBeats(
      reinterpret_cast<const uint8_t*>(pcm.data()), size, channels, [&](char p) {
        run.progress.push_back(p);
        return p >= cancel_at;
      });
  return Finished(&analyzer, count, std::move(run));
}

Outcome Stream(const std::vector<int16_t>& pcm, int rate, int channels, int32_t block,
               int64_t announced) {
  const int32_t frames = static_cast<int32_t>(pcm.size() / channels);
  Outcome run;
  AudioAnalyzer analyzer(rate);
  testing::internal::CaptureStderr();
  EXPECT_TRUE(analyzer.Begin(channels, announced, [&](char p) {
    run.progress.push_back(p);
    return false;
  }));
  for (int32_t first = 0; first < frames; first += block) {
    EXPECT_TRUE(analyzer.Feed(&pcm[static_cast<size_t>(first) * channels],
                              std::min(block, frames - first)));
  }
  const int32_t count = analyzer.Finish();
  return Finished(&analyzer, count, std::move(run));
}

int32_t Bytes(const std::vector<int16_t>& pcm) { return static_cast<int32_t>(2 * pcm.size()); }

TEST(AudioAnalyzer, StreamedBlocksGiveTheWholeBufferRun) {
  const int rate = 22050;
  const std::vector<int16_t> pcm = test_signals::Clicks(rate, 2, 20, 0.5);
  const int64_t frames = static_cast<int64_t>(pcm.size() / 2);
  const Outcome whole = Analyze(pcm, Bytes(pcm), rate, 2);
  ASSERT_GT(whole.count, 30);
  // Two equal channels are the mono signal.
  const std::vector<int16_t> mono = test_signals::Clicks(rate, 1, 20, 0.5);
  EXPECT_EQ(Analyze(mono, Bytes(mono), rate, 1).beats, whole.beats);
  for (int32_t block : {1, 7, 441, 4096, 65536}) {
    const Outcome run = Stream(pcm, rate, 2, block, frames);
    EXPECT_EQ(run.count, whole.count) << block;
    EXPECT_EQ(run.beats, whole.beats) << block;
    EXPECT_EQ(run.progress, whole.progress) << block;
    EXPECT_EQ(run.log, whole.log) << block;
  }
  // A wrong or unknown length only moves the progress bytes, never backwards.
  for (int64_t announced : {frames / 3, 3 * frames, int64_t{-1}}) {
    const Outcome run = Stream(pcm, rate, 2, 4096, announced);
    EXPECT_EQ(run.beats, whole.beats) << announced;
    EXPECT_TRUE(std::is_sorted(run.progress.begin(), run.progress.end())) << announced;
    EXPECT_LE(run.progress.back(), 98);
  }
  // Nothing fed after an unknown length: nothing to analyse.
  Outcome empty = Stream({}, rate, 2, 4096, -1);
  EXPECT_EQ(empty.count, -1);
  EXPECT_NE(empty.log.find(" Input samples size: 0\n"), std::string::npos);
  EXPECT_EQ(empty.log.find("Onset"), std::string::npos);
}

TEST(AudioAnalyzer, ProgressFailuresAndCancellation) {
  const std::vector<int16_t> pcm = test_signals::Clicks(8000, 3, 3, 0.5);
  const int32_t size = Bytes(pcm);

  // Each stage starts at its third of the bytes and rises toward the next.
  Outcome run = Analyze(pcm, size, 8000, 3);
  EXPECT_TRUE(std::is_sorted(run.progress.begin(), run.progress.end()));
  for (int first : {0, 33, 66}) {
    EXPECT_NE(std::find(run.progress.begin(), run.progress.end(), first), run.progress.end());
    EXPECT_EQ(std::count_if(run.progress.begin(), run.progress.end(),
                            [first](int p) { return p >= first && p < first + 33; }),
              first == 66 ? 1 : 3);  // every 100 frames of 299, every 500 of the tracker's
  }

  run = Analyze(pcm, size, 8000, 0);
  EXPECT_EQ(run.count, -1);
  EXPECT_NE(run.log.find(" Channels are less than one!\n"), std::string::npos);
  EXPECT_TRUE(run.progress.empty());

  run = Analyze(pcm, -10, 8000, 3);
  EXPECT_EQ(run.count, -1);
  EXPECT_NE(run.log.find(" Input samples size: 0\n"), std::string::npos);

  // Ten bytes of stereo are two frames; the last two bytes are ignored.
  run = Analyze(pcm, 10, 8000, 2);
  EXPECT_NE(run.log.find(" Input samples size: 2\n"), std::string::npos);

  run = Analyze(pcm, size, 8000, 3, 0);
  EXPECT_EQ(run.count, -1);
  EXPECT_EQ(run.progress, std::vector<int>{0});
  EXPECT_NE(run.log.find("Spectrogram process failed!"), std::string::npos);

  run = Analyze(pcm, size, 8000, 3, 33);
  EXPECT_EQ(run.count, -1);
  EXPECT_EQ(run.progress.back(), 33);
  EXPECT_NE(run.log.find("Onset process failed!"), std::string::npos);

  run = Analyze(pcm, size, 8000, 3, 66);
  EXPECT_EQ(run.count, 0);
  EXPECT_EQ(run.progress.back(), 66);
  EXPECT_NE(run.log.find("Estimated BPM = 0\n"), std::string::npos);
}

}  // namespace
}  // namespace apm
