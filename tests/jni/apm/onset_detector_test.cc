#include "jni/apm/onset_detector.h"

#include <gtest/gtest.h>

#include <cmath>
#include <complex>

namespace apm {
namespace {

const ProgressCallback kNoProgress = [](float) { return false; };

// Frames of a steady tone: constant magnitudes, phases advancing linearly.
std::vector<SpectrogramFrame> SteadyTone(int frames, int bins) {
  std::vector<SpectrogramFrame> spectrogram(frames, SpectrogramFrame(bins));
  for (int t = 0; t < frames; ++t) {
    for (int k = 0; k < bins; ++k) {
      spectrogram[t][k] = std::polar(10.0f + k, 0.3f * k * t + 0.1f * k);
    }
  }
  return spectrogram;
}

// The distance between each bin and its prediction, summed in double.
double Reference(const std::vector<SpectrogramFrame>& s, int t) {
  double sum = 0;
  for (size_t k = 0; k < s[t].size(); ++k) {
    const double magnitude = t >= 1 ? std::abs(std::complex<double>(s[t - 1][k])) : 0;
    const double phase1 = t >= 1 ? std::arg(std::complex<double>(s[t - 1][k])) : -M_PI;
    const double phase2 = t >= 2 ? std::arg(std::complex<double>(s[t - 2][k])) : -M_PI;
    const std::complex<double> predicted = std::polar(magnitude, 2 * phase1 - phase2);
    sum += std::abs(predicted - std::complex<double>(s[t][k]));
  }
  return sum;
}

TEST(OnsetDetector, EmptySpectrogramIsAnError) {
  OnsetDetector detector;
  std::vector<float> values = {7.0f};
  testing::internal::CaptureStderr();
  EXPECT_FALSE(detector.ComputeDetectionFunction({}, &values, kNoProgress, false));
  EXPECT_EQ(values, std::vector<float>{7.0f});
  EXPECT_FALSE(detector.ComputeDetectionFunction({}, &values, kNoProgress, true));
  EXPECT_TRUE(values.empty());
  const std::string log = testing::internal::GetCapturedStderr();
  EXPECT_NE(log.find("onset_detector.cc:"), std::string::npos);
  EXPECT_NE(log.find(" Empty input for onset detector! \n"), std::string::npos);
}

TEST(OnsetDetector, ValuesFollowThePhasePrediction) {
  OnsetDetector detector;
  std::vector<float> values;
  // A single frame: the sum of its magnitudes.
  ASSERT_TRUE(detector.ComputeDetectionFunction({{{3, 4}, {0, -2}, {1, 0}}}, &values,
                                                kNoProgress, true));
  ASSERT_EQ(values.size(), 1u);
  EXPECT_NEAR(values[0], 8.0f, 1e-5);

  // Silence, then a steady tone: zeros, then a settling tone near zero.
  std::vector<SpectrogramFrame> spectrogram(3, SpectrogramFrame(5));
  const auto tone = SteadyTone(10, 5);
  spectrogram.insert(spectrogram.end(), tone.begin(), tone.end());
  ASSERT_TRUE(detector.ComputeDetectionFunction(spectrogram, &values, kNoProgress, true));
  ASSERT_EQ(values.size(), 13u);
  for (int t = 0; t < 3; ++t) EXPECT_EQ(values[t], 0.0f);
  double magnitudes = 0;
  for (const auto& bin : tone[0]) magnitudes += std::abs(bin);
  EXPECT_NEAR(values[3], magnitudes, 1e-4 * magnitudes);
  for (int t = 5; t < 13; ++t) EXPECT_LT(values[t], 1e-3 * magnitudes) << t;

  // Against a double-precision reference, and the same with conjugated bins.
  std::vector<SpectrogramFrame> chirp(6, SpectrogramFrame(1025));
  uint32_t seed = 7;
  for (auto& frame : chirp) {
    for (auto& bin : frame) {
      seed = seed * 1664525u + 1013904223u;
      bin = std::polar(static_cast<float>(seed >> 16), static_cast<float>(seed % 6283) / 1000);
    }
  }
  std::vector<SpectrogramFrame> conjugated = chirp;
  for (auto& frame : conjugated) for (auto& bin : frame) bin = std::conj(bin);
  std::vector<float> mirrored;
  ASSERT_TRUE(detector.ComputeDetectionFunction(chirp, &values, kNoProgress, true));
  ASSERT_TRUE(detector.ComputeDetectionFunction(conjugated, &mirrored, kNoProgress, true));
  for (int t = 0; t < 6; ++t) {
    const double expected = Reference(chirp, t);
    EXPECT_NEAR(values[t], expected, 1e-5 * expected) << t;
    EXPECT_NEAR(mirrored[t], values[t], 1e-5 * expected) << t;
  }
}

// Bins run four at a time with a one-at-a-time tail; both must give the same
// bits, which equal bins in every position reveal.
// Thirteen bins run through every lane width the machine has (eight, four,
// one): each bin must give the one-bin value, summed four lanes wide.
TEST(OnsetDetector, EveryLaneWidthGivesTheSameBits) {
  auto frames = [](int bins) {
    std::vector<SpectrogramFrame> spectrogram;
    for (int t = 0; t < 4; ++t) {
      spectrogram.emplace_back(bins, std::polar(1000.0f + 37 * t, 0.7f + 1.9f * t));
    }
    spectrogram[2].assign(bins, {0.0f, 0.0f});
    return spectrogram;
  };
  OnsetDetector detector;
  std::vector<float> one, thirteen;
  ASSERT_TRUE(detector.ComputeDetectionFunction(frames(1), &one, kNoProgress, true));
  ASSERT_TRUE(detector.ComputeDetectionFunction(frames(13), &thirteen, kNoProgress, true));
  for (int t = 0; t < 4; ++t) {
    const float lane = one[t] + one[t] + one[t];
    EXPECT_EQ(thirteen[t], (lane + lane) + (lane + lane) + one[t]) << t;
  }
}

TEST(OnsetDetector, ProgressCancellationAndAppending) {
  const auto spectrogram = SteadyTone(250, 4);
  OnsetDetector detector;
  std::vector<float> reports, values = {1.0f, 2.0f};
  ASSERT_TRUE(detector.ComputeDetectionFunction(
      spectrogram, &values, [&](float p) { reports.push_back(p); return false; }, false));
  EXPECT_EQ(reports, (std::vector<float>{0.0f, 0.4f, 0.8f}));
  EXPECT_EQ(values.size(), 252u);
  EXPECT_EQ(values[1], 2.0f);

  std::vector<float> replayed;
  EXPECT_TRUE(detector.ReplayPass(250, [&](float p) { replayed.push_back(p); return false; }));
  EXPECT_EQ(replayed, reports);

  EXPECT_FALSE(detector.ComputeDetectionFunction(
      spectrogram, &values, [](float p) { return p > 0.3f; }, true));
  EXPECT_EQ(values.size(), 100u);
  EXPECT_FALSE(detector.ComputeDetectionFunction(
      spectrogram, &values, [](float) { return true; }, true));
  EXPECT_TRUE(values.empty());
}

}  // namespace
}  // namespace apm
