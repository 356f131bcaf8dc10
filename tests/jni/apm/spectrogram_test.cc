#include "jni/apm/spectrogram.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>

namespace apm {
namespace {

const ProgressCallback kNoProgress = [](float) { return false; };

std::vector<float> Noise(size_t count, unsigned seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<float> sample(-32768.0f, 32767.0f);
  std::vector<float> samples(count);
  for (float& s : samples) s = sample(random);
  return samples;
}

TEST(SpectrogramHelpers, PowerOfTwoAndPeriodicHann) {
  EXPECT_EQ(NextPowerOfTwo(-5), 0);
  EXPECT_EQ(NextPowerOfTwo(0), 0);
  EXPECT_EQ(NextPowerOfTwo(1), 1);
  EXPECT_EQ(NextPowerOfTwo(3), 4);
  EXPECT_EQ(NextPowerOfTwo(1764), 2048);
  EXPECT_EQ(NextPowerOfTwo(2048), 2048);

  std::vector<double> window;
  MakePeriodicHannWindow(4, &window);
  ASSERT_EQ(window.size(), 4u);
  EXPECT_EQ(window[0], 0.0);
  EXPECT_NEAR(window[1], 0.5, 1e-15);
  EXPECT_EQ(window[2], 1.0);
  EXPECT_NEAR(window[3], 0.5, 1e-15);
}

TEST(Spectrogram, RejectsBadSettingsAndRecovers) {
  Spectrogram spectrogram;
  std::vector<SpectrogramFrame> frames;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(spectrogram.ComputeComplexSpectrogram({1, 2}, &frames, kNoProgress));
  EXPECT_FALSE(spectrogram.Initialize(1, 1));
  EXPECT_FALSE(spectrogram.Initialize(-3, 1));
  EXPECT_FALSE(spectrogram.Initialize(4, 0));
  const std::string log = testing::internal::GetCapturedStderr();
  EXPECT_NE(log.find("ComputeComplexSpectrogram() called before successful call "
                     "to Initialize()."),
            std::string::npos);
  EXPECT_NE(log.find("spectrogram.cc:"), std::string::npos);
  EXPECT_NE(log.find(" Window length too short.\n"), std::string::npos);
  EXPECT_NE(log.find(" Step length must be positive.\n"), std::string::npos);

  EXPECT_TRUE(spectrogram.Initialize(4, 2));
  EXPECT_TRUE(spectrogram.ComputeComplexSpectrogram({1, 2, 3, 4}, &frames, kNoProgress));
  EXPECT_EQ(frames.size(), 1u);
}

TEST(Spectrogram, FrameGridAndQueuedRemainder) {
  const int32_t w = 1764, s = 441;
  Spectrogram spectrogram;
  std::vector<SpectrogramFrame> frames;
  for (auto [count, expected] : {std::pair{w - 1, 0}, {w, 1}, {w + s - 1, 1},
                                 {w + s, 2}, {w + 10 * s + 7, 11}}) {
    ASSERT_TRUE(spectrogram.Initialize(w, s));
    ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram(Noise(count, 1), &frames,
                                                      kNoProgress));
    EXPECT_EQ(static_cast<int>(frames.size()), expected) << count;
    for (const auto& frame : frames) EXPECT_EQ(frame.size(), 1025u);
  }
  // One sample short of a window stays queued; the next sample completes it.
  ASSERT_TRUE(spectrogram.Initialize(w, s));
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram(Noise(w - 1, 2), &frames, kNoProgress));
  EXPECT_TRUE(frames.empty());
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram({5.0f}, &frames, kNoProgress));
  EXPECT_EQ(frames.size(), 1u);
}

// Windows read in place, gathered across pieces, and skipped over when the
// step is longer than the window all give the same frames.
TEST(Spectrogram, PiecewiseFeedingIsBitIdentical) {
  const std::vector<float> signal = Noise(30000, 3);
  for (auto [window, step] : {std::pair{882, 221}, {100, 300}, {64, 64}}) {
    SCOPED_TRACE(step);
    Spectrogram whole;
    ASSERT_TRUE(whole.Initialize(window, step));
    std::vector<SpectrogramFrame> expected;
    ASSERT_TRUE(whole.ComputeComplexSpectrogram(signal, &expected, kNoProgress));

    Spectrogram pieces;
    ASSERT_TRUE(pieces.Initialize(window, step));
    std::vector<SpectrogramFrame> collected, frames;
    std::mt19937 random(4);
    for (size_t start = 0; start < signal.size();) {
      const size_t length = std::min<size_t>(random() % 1500, signal.size() - start);
      ASSERT_TRUE(pieces.ComputeComplexSpectrogram(
          std::vector<float>(signal.begin() + start, signal.begin() + start + length),
          &frames, kNoProgress));
      collected.insert(collected.end(), frames.begin(), frames.end());
      start += length;
    }
    EXPECT_EQ(collected, expected);
  }
}

TEST(Spectrogram, BinsAreTheUnscaledPlusSineTransformOfTheWindowedFrame) {
  const int32_t w = 300, s = 100, n = 512;
  const std::vector<float> signal = Noise(w + s, 5);
  Spectrogram spectrogram;
  ASSERT_TRUE(spectrogram.Initialize(w, s));
  std::vector<SpectrogramFrame> frames;
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram(signal, &frames, kNoProgress));
  ASSERT_EQ(frames.size(), 2u);
  std::vector<double> window;
  MakePeriodicHannWindow(w, &window);
  for (int k = 0; k <= n / 2; k += 7) {
    double re = 0, im = 0;
    for (int j = 0; j < w; ++j) {
      const double x = window[j] * signal[s + j];
      re += x * std::cos(2 * M_PI * j * k / n);
      im += x * std::sin(2 * M_PI * j * k / n);
    }
    EXPECT_NEAR(frames[1][k].real(), re, 1e-3 + std::abs(re) * 1e-6) << k;
    EXPECT_NEAR(frames[1][k].imag(), im, 1e-3 + std::abs(im) * 1e-6) << k;
  }
  EXPECT_EQ(frames[1][0].imag(), 0.0f);
  EXPECT_EQ(frames[1][n / 2].imag(), 0.0f);
}

TEST(Spectrogram, SmallWindowsConstantsAndLongSteps) {
  Spectrogram spectrogram;
  std::vector<SpectrogramFrame> frames;
  // Two coefficients of a periodic Hann window are 0 and 1.
  ASSERT_TRUE(spectrogram.Initialize(2, 2));
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram({3, 5, 7, 11}, &frames, kNoProgress));
  ASSERT_EQ(frames.size(), 2u);
  EXPECT_EQ(frames[1], (SpectrogramFrame{{11, 0}, {-11, 0}}));

  ASSERT_TRUE(spectrogram.Initialize(1764, 441));
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram(std::vector<float>(1764, 100.0f),
                                                    &frames, kNoProgress));
  EXPECT_NEAR(frames[0][0].real(), 100.0 * 1764 / 2, 1e-6 * 100 * 1764);
  EXPECT_EQ(frames[0][0].imag(), 0.0f);

  // With a step beyond the window, the samples between windows are unused.
  std::vector<float> signal = Noise(1000, 6);
  ASSERT_TRUE(spectrogram.Initialize(100, 300));
  std::vector<SpectrogramFrame> expected;
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram(signal, &expected, kNoProgress));
  for (int i = 100; i < 300; ++i) signal[i] = 0;
  ASSERT_TRUE(spectrogram.Initialize(100, 300));
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram(signal, &frames, kNoProgress));
  EXPECT_EQ(frames.size(), 4u);
  EXPECT_EQ(frames, expected);
}

TEST(Spectrogram, ReportsProgressEveryHundredFramesAndCancels) {
  Spectrogram spectrogram;
  ASSERT_TRUE(spectrogram.Initialize(4, 2));
  std::vector<float> reports;
  std::vector<SpectrogramFrame> frames;
  // 502 samples: 250 frames over 251 whole steps.
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram(
      std::vector<float>(502, 1.0f), &frames,
      [&](float p) { reports.push_back(p); return false; }));
  EXPECT_EQ(frames.size(), 250u);
  EXPECT_EQ(reports, (std::vector<float>{0.0f, 100.0f / 251, 200.0f / 251}));

  ASSERT_TRUE(spectrogram.Initialize(4, 2));
  EXPECT_FALSE(spectrogram.ComputeComplexSpectrogram(
      std::vector<float>(502, 1.0f), &frames, [](float p) { return p > 0; }));
  EXPECT_EQ(frames.size(), 100u);
}

}  // namespace
}  // namespace apm
