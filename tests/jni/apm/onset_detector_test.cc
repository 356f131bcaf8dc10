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

  // Phase -pi stands in for the frame before the first: 1 then predicts -1
  // (|i + 1| = sqrt 2 from i), and phases 0, pi/2 predict -1, met exactly.
  ASSERT_TRUE(detector.ComputeDetectionFunction({{{1, 0}}, {{0, 1}}, {{-1, 0}}}, &values,
                                                kNoProgress, true));
  ASSERT_EQ(values.size(), 3u);
  EXPECT_NEAR(values[0], 1.0f, 1e-6);
  EXPECT_NEAR(values[1], std::sqrt(2.0f), 1e-6);
  EXPECT_NEAR(values[2], 0.0f, 1e-6);
}

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

  EXPECT_FALSE(detector.ComputeDetectionFunction(
      spectrogram, &values, [](float p) { return p > 0.3f; }, true));
  EXPECT_EQ(values.size(), 100u);
  EXPECT_FALSE(detector.ComputeDetectionFunction(
      spectrogram, &values, [](float) { return true; }, true));
  EXPECT_TRUE(values.empty());
}

}  // namespace
}  // namespace apm
