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

// Defaults step down to stay within the budget: very high three times, then
// high, medium and finally low beyond it. Given qualities are final and cost
// their table value. Every test leaves the process-wide load at 0.
TEST(AudioResamplerLoad, DefaultsStepDownAndGivenQualitiesCostTheirValue) {
  ASSERT_EQ(AudioResampler::getCurrentLoadMHz(), 0u);
  const int qualities[] = {0, 0, 0, 0, 0, 0, 1, 2, 3, 4, 5, -1};
  std::vector<Resampler> live;
  std::vector<uint32_t> loads;
  for (int quality : qualities) {
    live.push_back(Create(16, 2, 48000, static_cast<AudioResampler::src_quality>(quality)));
    loads.push_back(AudioResampler::getCurrentLoadMHz());
  }
  EXPECT_EQ(loads,
            (std::vector<uint32_t>{34, 68, 102, 122, 128, 131, 134, 140, 160, 194, 197, 200}));
  // Each instance gives back what it drew.
  live.erase(live.begin() + 3);
  EXPECT_EQ(AudioResampler::getCurrentLoadMHz(), 180u);
  live.clear();
  EXPECT_EQ(AudioResampler::getCurrentLoadMHz(), 0u);
}

// Formats and rates it cannot take are logged, yet it builds; a fresh
// instance has gain 0 and mixes in nothing.
TEST(AudioResamplerCreate, LogsUnsupportedFormatsAndRatesAndStartsSilent) {
  const struct {
    int bits, channels;
    int32_t rate;
    const char* log;
  } cases[] = {
      {8, 1, 44100, "AudioResampler : Unsupported sample format, 8 bits, 1 channels\n"},
      {16, 3, -5, "AudioResampler : Unsupported sample format, 16 bits, 3 channels\n"
                  "AudioResampler : Unsupported sample rate -5 Hz\n"},
      {16, 1, 8000, ""},
      {16, 2, 192000, ""},
  };
  for (const auto& c : cases) {
    testing::internal::CaptureStderr();
    Resampler r = Create(c.bits, c.channels, c.rate);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), c.log) << c.bits << " " << c.channels;
    ASSERT_NE(r, nullptr);
    const std::vector<int16_t> in = {1000, -1000, 2000, -2000};
    std::vector<int16_t> out(4, 7);
    if (c.rate > 0) r->resample(out.data(), in.data(), 4 / c.channels);
    EXPECT_EQ(out, std::vector<int16_t>(4, 7));
  }
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

// Rates that give no usable increment, and channel counts other than one or
// two, write nothing and say so once.
TEST(AudioResamplerRates, UnsupportedRatesAndLayoutsWriteNothingAndLogOnce) {
  const struct {
    int channels;
    int32_t output, source;
    const char* log;
  } cases[] = {
      {1, 48000, 0, "AudioResampler : Unsupported resampling from 0 Hz to 48000 Hz: no output\n"},
      {1, 48000, -44100,
       "AudioResampler : Unsupported resampling from -44100 Hz to 48000 Hz: no output\n"},
      {1, 16000, 48001,
       "AudioResampler : Unsupported resampling from 48001 Hz to 16000 Hz: no output\n"},
      {1, 48000, 2147483647,
       "AudioResampler : Unsupported resampling from 2147483647 Hz to 48000 Hz: no output\n"},
      {1, 0, 44100,
       "AudioResampler : Unsupported sample rate 0 Hz\n"
       "AudioResampler : Unsupported resampling from 44100 Hz to 0 Hz: no output\n"},
      {0, 48000, 44100, "AudioResampler : Unsupported sample format, 16 bits, 0 channels\n"},
      {3, 48000, 44100, "AudioResampler : Unsupported sample format, 16 bits, 3 channels\n"},
      {-1, 48000, 44100, "AudioResampler : Unsupported sample format, 16 bits, -1 channels\n"},
  };
  for (const auto& c : cases) {
    for (bool stereoOutput : {false, true}) {
      SCOPED_TRACE(testing::Message() << c.channels << " " << c.source << " " << stereoOutput);
      testing::internal::CaptureStderr();
      Resampler r = Create(16, c.channels, c.output, AudioResampler::QUALITY_LOW, stereoOutput);
      r->setVolume(1.0f, 1.0f);
      r->setSourceSampleRate(c.source);
      EXPECT_EQ(r->getOutputSampleCount(100), 0u);
      const std::vector<int16_t> in(300, 1234);
      std::vector<int16_t> out(1000, -9);
      for (int block = 0; block < 3; ++block) r->resample(out.data(), in.data(), 100);
      EXPECT_EQ(testing::internal::GetCapturedStderr(), c.log);
      EXPECT_EQ(out, std::vector<int16_t>(1000, -9));
      EXPECT_EQ(r->getPhaseFraction(), 0u);
    }
  }
}

}  // namespace
}  // namespace norvane
