#include "jni/apm/onset_detector.h"

#include <gtest/gtest.h>

#include <cmath>
#include <complex>

namespace apm {
namespace {

const ProgressCallback kNoProgress = [](float) { return false; };

TEST(OnsetDetector, ValuesFollowThePhasePrediction) {
  OnsetDetector detector;
  std::vector<float> values;
  // Phase -pi stands in for the frame before the first: 1 then predicts -1
  // (|i + 1| = sqrt 2 from i), and phases 0, pi/2 predict -1, met exactly.
  ASSERT_TRUE(detector.ComputeDetectionFunction({{{1, 0}}, {{0, 1}}, {{-1, 0}}}, &values,
                                                kNoProgress, true));
  ASSERT_EQ(values.size(), 3u);
  const float expected[] = {1.0f, std::sqrt(2.0f), 0.0f};
  for (int t = 0; t < 3; ++t) EXPECT_NEAR(values[t], expected[t], 1e-6) << t;
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

// Bins handed over as doubles must give the bits of the frames of floats
// they round to, on every lane width; the halfway cases round to even.
TEST(OnsetDetector, DoubleBinsReadAsTheirNearestFloats) {
  constexpr int kBins = 13;
  const double tie = std::ldexp(1.0, -24);
  std::vector<std::vector<double>> doubles;
  std::vector<SpectrogramFrame> floats;
  for (int t = 0; t < 3; ++t) {
    std::vector<double> frame;
    for (int k = 0; k < 2 * kBins; ++k) {
      const double base = (k % 3 == 0) ? 1.0 + (k % 2 ? 3 : 1) * tie
                                       : std::sin(0.37 * (k + 1) + 1.3 * t) * (300.0 + k);
      frame.push_back(k % 5 == 4 ? -base : base);
    }
    floats.emplace_back();
    for (int k = 0; k < kBins; ++k) {
      floats.back().emplace_back(static_cast<float>(frame[2 * k]),
                                 static_cast<float>(frame[2 * k + 1]));
    }
    doubles.push_back(frame);
  }
  OnsetDetector from_doubles, from_floats;
  from_doubles.Reset(kBins);
  from_floats.Reset(kBins);
  for (int t = 0; t < 3; ++t) {
    EXPECT_EQ(from_doubles.DetectFrame(doubles[t].data()),
              from_floats.DetectFrame(floats[t].data())) << t;
  }
}

// An empty spectrogram is an error; a cancelled run keeps what it made.
TEST(OnsetDetector, ProgressCancellationAppendingAndEmptyInput) {
  const std::vector<SpectrogramFrame> spectrogram(250, SpectrogramFrame(4, {1, 2}));
  OnsetDetector detector;
  std::vector<float> reports, values = {1.0f, 2.0f};
  testing::internal::CaptureStderr();
  EXPECT_FALSE(detector.ComputeDetectionFunction({}, &values, kNoProgress, false));
  EXPECT_EQ(values, (std::vector<float>{1.0f, 2.0f}));
  EXPECT_FALSE(detector.ComputeDetectionFunction({}, &values, kNoProgress, true));
  EXPECT_TRUE(values.empty());
  const std::string log = testing::internal::GetCapturedStderr();
  EXPECT_NE(log.find("onset_detector.cc:"), std::string::npos);
  EXPECT_NE(log.find(" Empty input for onset detector! \n"), std::string::npos);
  values = {1.0f, 2.0f};
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
