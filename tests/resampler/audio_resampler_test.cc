#include "resampler/audio_resampler.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace norvane {
namespace {

using Resampler = std::unique_ptr<AudioResampler>;

Resampler Create(int bits, int channels, int32_t rate,
                 AudioResampler::src_quality quality = AudioResampler::QUALITY_LOW,
                 bool stereoOutput = false) {
  return Resampler(AudioResampler::create(bits, channels, rate, quality, stereoOutput));
}

// Every test leaves the process-wide load where it found it (at 0).
TEST(AudioResamplerLoad, DefaultQualityStepsDownToStayWithinTheBudget) {
  ASSERT_EQ(AudioResampler::getCurrentLoadMHz(), 0u);
  std::vector<Resampler> live;
  std::vector<uint32_t> loads;
  for (int i = 0; i < 6; ++i) {
    live.push_back(Create(16, 2, 48000, AudioResampler::QUALITY_DEFAULT));
    loads.push_back(AudioResampler::getCurrentLoadMHz());
  }
  // Very high three times, then high, medium, and finally low beyond budget.
  EXPECT_EQ(loads, (std::vector<uint32_t>{34, 68, 102, 122, 128, 131}));

  // Each instance gives back what it drew.
  live.erase(live.begin() + 3);
  EXPECT_EQ(AudioResampler::getCurrentLoadMHz(), 111u);
  live.clear();
  EXPECT_EQ(AudioResampler::getCurrentLoadMHz(), 0u);
}

TEST(AudioResamplerLoad, GivenQualitiesAreFinalAndCostTheirTableValue) {
  ASSERT_EQ(AudioResampler::getCurrentLoadMHz(), 0u);
  const struct {
    int quality;
    uint32_t cost;
  } cases[] = {{1, 3}, {2, 6}, {3, 20}, {4, 34}, {5, 3}, {-1, 3}};
  for (const auto& c : cases) {
    std::vector<Resampler> live;
    for (int i = 0; i < 5; ++i) {
      live.push_back(Create(16, 1, 48000, static_cast<AudioResampler::src_quality>(c.quality)));
    }
    EXPECT_EQ(AudioResampler::getCurrentLoadMHz(), 5 * c.cost) << "quality " << c.quality;
    live.clear();
    EXPECT_EQ(AudioResampler::getCurrentLoadMHz(), 0u);
  }
}

TEST(AudioResamplerCreate, LogsUnsupportedFormatsAndRatesAndBuildsAnyway) {
  const struct {
    int bits, channels;
    int32_t rate;
    const char* log;
  } cases[] = {
      {8, 1, 44100, "AudioResampler : Unsupported sample format, 8 bits, 1 channels\n"},
      {16, 2, 0, "AudioResampler : Unsupported sample rate 0 Hz\n"},
      {16, 3, -5, "AudioResampler : Unsupported sample format, 16 bits, 3 channels\n"
                  "AudioResampler : Unsupported sample rate -5 Hz\n"},
      {16, 0, 8000, "AudioResampler : Unsupported sample format, 16 bits, 0 channels\n"},
      {16, 1, 8000, ""},
      {16, 2, 192000, ""},
  };
  for (const auto& c : cases) {
    testing::internal::CaptureStderr();
    EXPECT_NE(Create(c.bits, c.channels, c.rate), nullptr);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), c.log) << c.bits << " " << c.channels;
  }
}

// A fresh instance has gain 0: it mixes in nothing.
TEST(AudioResamplerCreate, FreshInstanceIsSilent) {
  Resampler r = Create(16, 2, 48000);
  std::vector<int16_t> in = {1000, -1000, 2000, -2000};
  std::vector<int16_t> out(4, 7);
  r->resample(out.data(), in.data(), 2);
  EXPECT_EQ(out, (std::vector<int16_t>{7, 7, 7, 7}));
}

TEST(AudioResamplerRates, IncrementIsTruncatedThirtyBitFixedPoint) {
  const struct {
    int32_t source, output;
    uint32_t increment;
    uint64_t samples;  // stereo output samples for 481 input frames
  } cases[] = {
      {48000, 48000, 1073741824u, 962}, {44100, 48000, 986500300u, 1046},
      {48000, 16000, 3221225472u, 320}, {8000, 48000, 178956970u, 5772},
      {22050, 44100, 536870912u, 1924}, {1, 48000, 22369u, 46176000},
      {44100, 14700, 3221225472u, 320}, {96000, 44100, 2337397167u, 440},
  };
  for (const auto& c : cases) {
    Resampler r = Create(16, 2, c.output);
    r->setSourceSampleRate(c.source);
    EXPECT_EQ(r->getPhaseIncrement(), c.increment) << c.source << " -> " << c.output;
    EXPECT_EQ(r->getOutputSampleCount(481), c.samples) << c.source << " -> " << c.output;
  }
}

TEST(AudioResamplerRates, ResetClearsOnlyTheFraction) {
  Resampler r = Create(16, 1, 48000);
  r->setVolume(1.0f, 1.0f);
  r->setSourceSampleRate(44100);
  std::vector<int16_t> in(7, 500);
  std::vector<int16_t> out(8, 0);
  r->resample(out.data(), in.data(), in.size());
  EXPECT_NE(r->getPhaseFraction(), 0u);
  r->reset();
  EXPECT_EQ(r->getPhaseFraction(), 0u);
  // The last frame survives: the next block starts from 500, not from 0.
  std::vector<int16_t> next(2, 0);
  std::vector<int16_t> zeros(2, 0);
  r->setSourceSampleRate(48000);
  r->resample(next.data(), zeros.data(), 2);
  EXPECT_EQ(next, (std::vector<int16_t>{500, 0}));
}

// Rates that give no usable increment write nothing and say so once.
TEST(AudioResamplerRates, UnsupportedRatesWriteNothingAndLogOnce) {
  const struct {
    int32_t output, source;
    const char* log;
  } cases[] = {
      {48000, 0, "AudioResampler : Unsupported resampling from 0 Hz to 48000 Hz: no output\n"},
      {48000, -44100,
       "AudioResampler : Unsupported resampling from -44100 Hz to 48000 Hz: no output\n"},
      {16000, 48001,
       "AudioResampler : Unsupported resampling from 48001 Hz to 16000 Hz: no output\n"},
      {48000, 2147483647,
       "AudioResampler : Unsupported resampling from 2147483647 Hz to 48000 Hz: no output\n"},
      {0, 44100,
       "AudioResampler : Unsupported sample rate 0 Hz\n"
       "AudioResampler : Unsupported resampling from 44100 Hz to 0 Hz: no output\n"},
  };
  for (const auto& c : cases) {
    for (bool stereoOutput : {false, true}) {
      testing::internal::CaptureStderr();
      Resampler r = Create(16, 1, c.output, AudioResampler::QUALITY_LOW, stereoOutput);
      r->setVolume(1.0f, 1.0f);
      r->setSourceSampleRate(c.source);
      EXPECT_EQ(r->getOutputSampleCount(100), 0u);
      std::vector<int16_t> in(100, 1234);
      std::vector<int16_t> out(1000, -9);
      for (int block = 0; block < 3; ++block) r->resample(out.data(), in.data(), in.size());
      EXPECT_EQ(testing::internal::GetCapturedStderr(), c.log);
      EXPECT_EQ(out, std::vector<int16_t>(1000, -9));
      EXPECT_EQ(r->getPhaseFraction(), 0u);
    }
  }
}

}  // namespace
}  // namespace norvane
