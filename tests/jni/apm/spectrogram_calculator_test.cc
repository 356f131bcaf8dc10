#include "jni/apm/spectrogram_calculator.h"

#include <gtest/gtest.h>

#include "jni/apm/analysis_frame_rate.h"

namespace apm {
namespace {

const ProgressCallback kNoProgress = [](float) { return false; };

// The frame rate the analyzer reports must be the calculator's own.
TEST(SpectrogramCalculator, SampleRateTable) {
  const struct {
    double sample_rate;
    int window, step, frames_per_second, bins;
  } rows[] = {{8000, 320, 80, 100, 257},     {11025, 441, 110, 100, 257},
              {16000, 640, 160, 100, 513},   {22050, 882, 221, 99, 513},
              {44100, 1764, 441, 100, 1025}, {48000, 1920, 480, 100, 1025},
              {96000, 3840, 960, 100, 2049}, {1e6, 40000, 10000, 100, 32769}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.sample_rate);
    SpectrogramCalculator calculator(0.04f, 0.03f);
    ASSERT_TRUE(calculator.Initialize(row.sample_rate));
    EXPECT_EQ(calculator.frames_per_second(), row.frames_per_second);
    EXPECT_EQ(calculator.bin_count(), row.bins);
    const AnalysisFrameRate rate = FrameRateAt(row.sample_rate);
    EXPECT_EQ(rate.step, row.step);
    EXPECT_EQ(rate.frames_per_second, row.frames_per_second);
    EXPECT_EQ(rate.true_frames_per_second, row.sample_rate / row.step);
    // The frame grid: one frame per window, then one per step.
    std::vector<SpectrogramFrame> frames;
    for (auto [count, expected] : {std::pair{row.window - 1, 0}, {row.window, 1},
                                   {row.window + row.step - 1, 1},
                                   {row.window + row.step, 2}}) {
      ASSERT_TRUE(calculator.Initialize(row.sample_rate));
      ASSERT_TRUE(calculator.ComputeSpectrogram(std::vector<float>(count, 1.0f),
                                                &frames, kNoProgress));
      EXPECT_EQ(static_cast<int>(frames.size()), expected);
    }
  }
}

// Rates out of range or too low for a window, and an overlap leaving no step.
TEST(SpectrogramCalculator, FailuresAreReportedByTheStage) {
  for (auto [overlap, rate] : {std::pair{0.03f, -44100.0}, {0.03f, 0.0}, {0.03f, 1.000001e6},
                               {0.03f, 10.0}, {0.04f, 44100.0}}) {
    SCOPED_TRACE(rate);
    SpectrogramCalculator calculator(0.04f, overlap);
    std::vector<SpectrogramFrame> frames;
    testing::internal::CaptureStderr();
    EXPECT_FALSE(calculator.Initialize(rate));
    EXPECT_FALSE(calculator.ComputeSpectrogram(std::vector<float>(5000, 1.0f), &frames,
                                               kNoProgress));
    EXPECT_NE(testing::internal::GetCapturedStderr().find(
                  "spectrogram_calculator.cc:33 Failed to compute spectrogram!\n"),
              std::string::npos);
    if (overlap == 0.03f) {
      EXPECT_EQ(FrameRateAt(rate).step, 0);
      EXPECT_EQ(FrameRateAt(rate).true_frames_per_second, 0.0);
    }
  }
}

}  // namespace
}  // namespace apm
