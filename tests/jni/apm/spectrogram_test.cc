#include "jni/apm/spectrogram.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <utility>

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

TEST(Spectrogram, NextPowerOfTwo) {
  const std::pair<int32_t, int32_t> cases[] = {
      {-5, 0}, {0, 0}, {1, 1}, {2, 2}, {3, 4}, {1764, 2048}, {2048, 2048}, {1 << 30, 1 << 30}};
  for (const auto& [n, expected] : cases) EXPECT_EQ(NextPowerOfTwo(n), expected) << n;
}

// A failed set-up leaves the spectrogram unusable until a good one.
TEST(Spectrogram, RejectsBadSettingsAndRecovers) {
  Spectrogram spectrogram;
  std::vector<SpectrogramFrame> frames;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(spectrogram.ComputeComplexSpectrogram({1, 2}, &frames, kNoProgress));
  for (auto [window, step] : {std::pair{1, 1}, {-3, 1}, {4, 0}, {(1 << 30) + 1, 1}}) {
    ASSERT_TRUE(spectrogram.Initialize(4, 2));
    EXPECT_FALSE(spectrogram.Initialize(window, step));
    EXPECT_FALSE(spectrogram.ComputeComplexSpectrogram({1, 2, 3, 4}, &frames, kNoProgress))
        << window << " " << step;
  }
  const std::string log = testing::internal::GetCapturedStderr();
  for (const char* line : {"spectrogram.cc:", " ComputeComplexSpectrogram() called before "
                           "successful call to Initialize().\n",
                           " Window length too short.\n", " Step length must be positive.\n",
                           " Window length too long.\n"}) {
    EXPECT_NE(log.find(line), std::string::npos) << line;
  }
  EXPECT_TRUE(spectrogram.Initialize(4, 1));  // the shortest step
  EXPECT_TRUE(spectrogram.ComputeComplexSpectrogram({1, 2, 3, 4, 5}, &frames, kNoProgress));
  EXPECT_EQ(frames.size(), 2u);
}

// Windows read in place, gathered across pieces, and skipped over when the
// step is longer than the window all give the same frames; samples no
// window covers are never read.
TEST(Spectrogram, PiecesAndUncoveredSamplesChangeNothing) {
  const std::vector<float> signal = Noise(30000, 3);
  for (auto [window, step] : {std::pair{882, 221}, {100, 300}, {64, 64}}) {
    SCOPED_TRACE(step);
    Spectrogram whole, pieces;
    ASSERT_TRUE(whole.Initialize(window, step));
    ASSERT_TRUE(pieces.Initialize(window, step));
    std::vector<SpectrogramFrame> expected, collected, frames;
    ASSERT_TRUE(whole.ComputeComplexSpectrogram(signal, &expected, kNoProgress));
    std::vector<float> gapped = signal;
    for (size_t i = 0; i < gapped.size(); ++i) {
      if (static_cast<int>(i % step) >= window) gapped[i] = 0;
    }
    std::mt19937 random(4);
    for (size_t start = 0; start < gapped.size();) {
      // A lone sample first: the next window then starts in the queue.
      const size_t length =
          start == 0 ? 1 : std::min<size_t>(random() % 1500, gapped.size() - start);
      ASSERT_TRUE(pieces.ComputeComplexSpectrogram(
          std::vector<float>(gapped.begin() + start, gapped.begin() + start + length),
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
  // The two coefficients of a two-point periodic Hann window are 0 and 1. A
  // new set-up drops what is left of the last run's step.
  ASSERT_TRUE(spectrogram.Initialize(2, 4));
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram({3, 5, 7}, &frames, kNoProgress));
  ASSERT_TRUE(spectrogram.Initialize(2, 2));
  ASSERT_TRUE(spectrogram.ComputeComplexSpectrogram({3, 5, 7, 11}, &frames, kNoProgress));
  EXPECT_EQ(frames, (std::vector<SpectrogramFrame>{{{5, 0}, {-5, 0}}, {{11, 0}, {-11, 0}}}));
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
