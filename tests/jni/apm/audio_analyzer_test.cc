#include "jni/apm/audio_analyzer.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>

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

// Interleaved 16-bit PCM of `channels` equal channels: clicks every
// `period` seconds over low noise.
std::vector<uint8_t> Clicks(double seconds, int rate, int channels, double period) {
  const int frames = static_cast<int>(seconds * rate);
  std::vector<uint8_t> pcm(static_cast<size_t>(frames) * channels * 2);
  uint32_t noise = 1;
  for (int i = 0; i < frames; ++i) {
    noise = noise * 1664525u + 1013904223u;
    const double t = static_cast<double>(i) / rate;
    const double since_click = std::fmod(t, period);
    double v = static_cast<double>(noise >> 20) - 2048;
    if (since_click < 0.02) v += 20000 * std::exp(-since_click * 200) * std::sin(2 * M_PI * 300 * t);
    const int16_t sample = static_cast<int16_t>(v);
    for (int c = 0; c < channels; ++c) {
      std::memcpy(&pcm[(static_cast<size_t>(i) * channels + c) * 2], &sample, 2);
    }
  }
  return pcm;
}

struct Outcome {
  int32_t count;
  std::vector<int> progress;
  std::vector<float> beats;
  std::vector<float> detection;
  std::string log;
};

Outcome Analyze(const std::vector<uint8_t>& pcm, int32_t size, int rate, int channels,
            int cancel_at = 1000) {
  Outcome run;
  AudioAnalyzer analyzer(rate);
  testing::internal::CaptureStderr();
  run.count = analyzer.CalculateBeats(pcm.data(), size, channels, [&](char p) {
    run.progress.push_back(p);
    return p >= cancel_at;
  });
  run.log = testing::internal::GetCapturedStderr();
  if (run.count > 0) run.beats.assign(analyzer.beats(), analyzer.beats() + run.count);
  run.detection = analyzer.detection_function();
  return run;
}

TEST(AudioAnalyzer, StreamingGivesTheDetectionFunctionOfTheWholeSignal) {
  const int rate = 22050;
  const std::vector<uint8_t> pcm = Clicks(40, rate, 2, 0.5);
  const Outcome run = Analyze(pcm, static_cast<int32_t>(pcm.size()), rate, 2);

  // The same stages over the whole mono signal at once.
  std::vector<float> mono(pcm.size() / 4);
  for (size_t i = 0; i < mono.size(); ++i) {
    int16_t left, right;
    std::memcpy(&left, &pcm[4 * i], 2);
    std::memcpy(&right, &pcm[4 * i + 2], 2);
    mono[i] = (static_cast<float>(left) + static_cast<float>(right)) / 2.0f;
  }
  SpectrogramCalculator calculator(0.04f, 0.03f);
  ASSERT_TRUE(calculator.Initialize(rate));
  std::vector<SpectrogramFrame> frames;
  std::vector<float> spectrogram_reports, onset_reports, expected;
  ASSERT_TRUE(calculator.ComputeSpectrogram(
      mono, &frames, [&](float p) { spectrogram_reports.push_back(p); return false; }));
  OnsetDetector detector;
  ASSERT_TRUE(detector.ComputeDetectionFunction(
      frames, &expected, [&](float p) { onset_reports.push_back(p); return false; }, false));
  SubtractRunningMedian(2 * 99 + 1, &expected);
  ASSERT_TRUE(NormalizeDetectionFunction(&expected));
  EXPECT_EQ(run.detection, expected);

  // Progress bytes: 33 * stage + 33 * fraction, truncated.
  std::vector<int> bytes;
  for (float p : spectrogram_reports) bytes.push_back(static_cast<int>(std::fma(p, 33.0f, 0.0f)));
  for (float p : onset_reports) bytes.push_back(static_cast<int>(std::fma(p, 33.0f, 33.0f)));
  ASSERT_GT(run.progress.size(), bytes.size());
  EXPECT_EQ(std::vector<int>(run.progress.begin(), run.progress.begin() + bytes.size()), bytes);
  EXPECT_EQ(run.progress[bytes.size()], 66);
  for (size_t i = bytes.size() + 1; i < run.progress.size(); ++i) {
    EXPECT_GT(run.progress[i], run.progress[i - 1]);
    EXPECT_LE(run.progress[i], 98);
  }
}

Outcome Stream(const std::vector<uint8_t>& pcm, int rate, int channels, int32_t block,
               int64_t announced) {
  std::vector<int16_t> samples(pcm.size() / 2);
  std::memcpy(samples.data(), pcm.data(), 2 * samples.size());
  const int32_t frames = static_cast<int32_t>(samples.size() / channels);
  Outcome run;
  AudioAnalyzer analyzer(rate);
  testing::internal::CaptureStderr();
  EXPECT_TRUE(analyzer.Begin(channels, announced, [&](char p) {
    run.progress.push_back(p);
    return false;
  }));
  for (int32_t first = 0; first < frames; first += block) {
    EXPECT_TRUE(analyzer.Feed(&samples[static_cast<size_t>(first) * channels],
                              std::min(block, frames - first)));
  }
  run.count = analyzer.Finish();
  run.log = testing::internal::GetCapturedStderr();
  if (run.count > 0) run.beats.assign(analyzer.beats(), analyzer.beats() + run.count);
  return run;
}

TEST(AudioAnalyzer, StreamedBlocksGiveTheWholeBufferRun) {
  const int rate = 22050;
  const std::vector<uint8_t> pcm = Clicks(30, rate, 2, 0.5);
  const int64_t frames = static_cast<int64_t>(pcm.size() / 4);
  const Outcome whole = Analyze(pcm, static_cast<int32_t>(pcm.size()), rate, 2);
  ASSERT_GT(whole.count, 50);
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
}

TEST(AudioAnalyzer, FindsTheTempoOfClicks) {
  const std::vector<uint8_t> pcm = Clicks(20, 44100, 1, 0.6);
  const Outcome run = Analyze(pcm, static_cast<int32_t>(pcm.size()), 44100, 1);
  ASSERT_GT(run.count, 20);
  EXPECT_NE(run.log.find("Estimated BPM = 100\n"), std::string::npos) << run.log;
  for (size_t i = 1; i < run.beats.size(); ++i) {
    EXPECT_NEAR(run.beats[i] - run.beats[i - 1], 0.6, 0.011) << i;
  }
}

TEST(AudioAnalyzer, FailuresAndCancellation) {
  const std::vector<uint8_t> pcm = Clicks(3, 8000, 3, 0.5);
  const int32_t size = static_cast<int32_t>(pcm.size());

  Outcome run = Analyze(pcm, size, 8000, 0);
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
