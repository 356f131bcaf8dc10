#include "resampler/audio_resampler_order1.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <limits>
#include <memory>
#include <random>
#include <vector>

#include "resampler/audio_resampler.h"
#include "tests/test_signals.h"

namespace norvane {
namespace {

using Samples = std::vector<int16_t>;

std::unique_ptr<AudioResampler> Make(int channels, int32_t outputRate, int32_t sourceRate,
                                     float left = 1.0f, float right = 1.0f,
                                     bool stereoOutput = false) {
  std::unique_ptr<AudioResampler> r(AudioResampler::create(
      16, channels, outputRate, AudioResampler::QUALITY_LOW, stereoOutput));
  r->setSourceSampleRate(sourceRate);
  r->setVolume(left, right);
  return r;
}

// Resamples `in` into a fresh output of `size` samples preset to `fill`.
Samples Resample(AudioResampler* r, const Samples& in, int channels, size_t size,
                 int16_t fill = 0) {
  Samples out(size, fill);
  r->resample(out.data(), in.data(), in.size() / channels);
  return out;
}

// 24000 -> 48000 puts output 1 halfway between the silence before the
// stream and frame 0: the half rounds toward minus infinity.
TEST(Order1, HalfFrameRoundsTowardMinusInfinity) {
  for (auto [newer, half] : {std::pair<int16_t, int16_t>{-1, -1}, {1, 0}, {-3, -2},
                             {32767, 16383}, {-32768, -16384}}) {
    auto r = Make(1, 48000, 24000);
    EXPECT_EQ(Resample(r.get(), {newer}, 1, 2), (Samples{0, half})) << newer;
  }
}

// Output frame 1 at equal rates is input frame 0 times the gain, added to
// what the output held.
TEST(Order1, ProductsTruncateSaturateAndSumsWrap) {
  const float inf = std::numeric_limits<float>::infinity();
  const struct {
    float gain;
    int16_t in, held, result;
  } cases[] = {
      {0.5f, -3, 0, -1}, {0.5f, 3, 0, 1},  // toward zero
      {1e5f, 1000, 100, -7836},            // 10^8 wraps
      // INT32_MAX adds 0xffff, INT32_MIN adds 0, NaN adds 0.
      {1e10f, 1000, 100, 99}, {inf, 1000, 100, 99}, {-1e10f, 1000, 100, 100},
      {-inf, 1000, 100, 100}, {std::numeric_limits<float>::quiet_NaN(), 1000, 100, 100},
  };
  for (const auto& c : cases) {
    for (int channels : {1, 2}) {
      auto r = Make(channels, 48000, 48000, c.gain, c.gain);
      const Samples out = Resample(r.get(), Samples(2 * channels, c.in), channels,
                                   2 * channels, c.held);
      EXPECT_EQ(out[channels], c.result) << c.gain << " " << c.in << " " << channels;
    }
  }
}

// A gain too large for the one-register path sends stereo input down the
// sample-by-sample one, where the right channel must keep step too and the
// left one's products saturate (adding 0xffff).
TEST(Order1, LargeGainPathKeepsTheRightChannelInStep) {
  auto r = Make(2, 48000, 48000, 1e5f, 1.0f);
  EXPECT_EQ(Resample(r.get(), {30000, 10, 30000, 20, 30000, 30, 30000, 40}, 2, 8),
            (Samples{0, 0, -1, 10, -1, 20, -1, 30}));
}

// A stream of 600 random blocks (seed 20240611) of up to 700 loud frames,
// mixed into outputs that are either zero or random, with the source rate,
// the gains or the position changed now and then. The digest covers every
// output sample and the phase fraction after each block; the values were
// taken when an independent model of the converter agreed with it.
uint64_t StreamDigest(int channels, bool stereoOutput, int32_t outputRate) {
  std::mt19937 random(20240611);
  auto uniform = [&random](int lo, int hi) {
    return std::uniform_int_distribution<int>(lo, hi)(random);
  };
  auto r = Make(channels, outputRate, outputRate, 1.0f, 1.0f, stereoOutput);
  uint64_t digest = test_signals::Fnv1a(nullptr, 0);
  for (int block = 0; block < 600; ++block) {
    const int event = uniform(0, 9);
    if (event == 0) {
      const int32_t rates[] = {outputRate, 3 * outputRate, 8000, 11025, 44100, 48000,
                               uniform(outputRate / 8, 3 * outputRate)};
      r->setSourceSampleRate(std::min(rates[uniform(0, 6)], 3 * outputRate));
    } else if (event == 1) {
      const float left = std::uniform_real_distribution<float>(-3.0f, 3.0f)(random);
      r->setVolume(left, uniform(0, 3) == 0 ? 1.0f : left * 0.75f);
    } else if (event == 2) {
      r->reset();
    }
    Samples in(static_cast<size_t>(uniform(0, 700)) * channels);
    for (int16_t& s : in) s = static_cast<int16_t>(uniform(-32768, 32767));
    Samples out(r->getOutputSampleCount(in.size() / channels) + 8);
    if (uniform(0, 1) == 1) {
      for (int16_t& s : out) s = static_cast<int16_t>(uniform(-32768, 32767));
    }
    r->resample(out.data(), in.data(), in.size() / channels);
    const uint32_t fraction = r->getPhaseFraction();
    digest = test_signals::Fnv1a(out.data(), out.size() * sizeof(int16_t), digest);
    digest = test_signals::Fnv1a(&fraction, sizeof(fraction), digest);
  }
  return digest;
}

TEST(Order1, LongRandomStreamsKeepTheirDigests) {
  const struct {
    int channels;
    bool stereoOutput;
    int32_t outputRate;
    uint64_t digest;
  } layouts[] = {{1, false, 48000, 18257387591141325978u},
                 {1, true, 44100, 13772018600117054307u},
                 {2, false, 16000, 7125344053441576989u},
                 {2, true, 48000, 4103886304320472838u}};
  for (const auto& l : layouts) {
    EXPECT_EQ(StreamDigest(l.channels, l.stereoOutput, l.outputRate), l.digest)
        << l.channels << " channels, stereo output " << l.stereoOutput << ", " << l.outputRate;
  }
}

}  // namespace
}  // namespace norvane
