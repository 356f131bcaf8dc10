#include "jni/apm/spectrogram_calculator.h"

#include <gtest/gtest.h>

namespace apm {
namespace {

const ProgressCallback kNoProgress = [](float) { return false; };

struct RateRow {
  int sample_rate, window, step, frames_per_second, bins;
};

TEST(SpectrogramCalculator, SampleRateTable) {
  for (const RateRow& row : {RateRow{8000, 320, 80, 100, 257},
                             RateRow{11025, 441, 110, 100, 257},
                             RateRow{16000, 640, 160, 100, 513},
                             RateRow{22050, 882, 221, 99, 513},
                             RateRow{44100, 1764, 441, 100, 1025},
                             RateRow{48000, 1920, 480, 100, 1025},
                             RateRow{96000, 3840, 960, 100, 2049}}) {
    SpectrogramCalculator calculator(0.04f, 0.03f);
    ASSERT_TRUE(calculator.Initialize(row.sample_rate));
    EXPECT_EQ(calculator.frames_per_second(), row.frames_per_second) << row.sample_rate;
    EXPECT_EQ(calculator.bin_count(), row.bins) << row.sample_rate;
    // The frame grid: one frame per window, then one per step.
    std::vector<SpectrogramFrame> frames;
    for (auto [count, expected] : {std::pair{row.window - 1, 0}, {row.window, 1},
                                   {row.window + row.step - 1, 1},
                                   {row.window + row.step, 2}}) {
      ASSERT_TRUE(calculator.Initialize(row.sample_rate));
      ASSERT_TRUE(calculator.ComputeSpectrogram(std::vector<float>(count, 1.0f),
                                                &frames, kNoProgress));
      EXPECT_EQ(static_cast<int>(frames.size()), expected) << row.sample_rate;
      EXPECT_EQ(calculator.num_frames(), expected);
      EXPECT_EQ(calculator.num_input_samples(), count);
    }
  }
}

TEST(SpectrogramCalculator, FailuresAreReportedByTheStage) {
  std::vector<SpectrogramFrame> frames;
  for (double rate : {-44100.0, 0.0, 1e9}) {
    SpectrogramCalculator calculator(0.04f, 0.03f);
    testing::internal::CaptureStderr();
    EXPECT_FALSE(calculator.Initialize(rate));
    EXPECT_FALSE(calculator.ComputeSpectrogram(std::vector<float>(5000, 1.0f), &frames,
                                               kNoProgress));
    const std::string log = testing::internal::GetCapturedStderr();
    EXPECT_NE(log.find("spectrogram_calculator.cc:33 Failed to compute spectrogram!\n"),
              std::string::npos)
        << log;
  }
  SpectrogramCalculator no_step(0.04f, 0.04f);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(no_step.Initialize(44100));
  EXPECT_FALSE(no_step.ComputeSpectrogram(std::vector<float>(5000, 1.0f), &frames,
                                          kNoProgress));
  const std::string log = testing::internal::GetCapturedStderr();
  EXPECT_NE(log.find("Step length must be positive."), std::string::npos);
  EXPECT_NE(log.find("Failed to compute spectrogram!"), std::string::npos);
  EXPECT_EQ(no_step.num_frames(), 0);
}

}  // namespace
}  // namespace apm
