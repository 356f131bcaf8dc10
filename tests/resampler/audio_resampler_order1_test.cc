#include "resampler/audio_resampler_order1.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <random>
#include <vector>

#include "resampler/audio_resampler.h"

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
Samples Resample(AudioResampler* r, const Samples& in, int channels, size_t size, int16_t fill = 0) {
  Samples out(size, fill);
  r->resample(out.data(), in.data(), in.size() / channels);
  return out;
}

TEST(Order1EqualRates, DelaysTheStreamByOneFrame) {
  auto mono = Make(1, 44100, 44100);
  EXPECT_EQ(Resample(mono.get(), {1, 2, 3, 4}, 1, 4), (Samples{0, 1, 2, 3}));
  EXPECT_EQ(Resample(mono.get(), {5, 6}, 1, 2), (Samples{4, 5}));

  auto stereo = Make(2, 48000, 48000, 1.0f, -1.0f);
  EXPECT_EQ(Resample(stereo.get(), {10, 20, 30, 40}, 2, 4), (Samples{0, 0, 10, -20}));
  EXPECT_EQ(Resample(stereo.get(), {50, 60}, 2, 2), (Samples{30, -40}));
}

TEST(Order1EqualRates, MonoToStereoAppliesOneGainPerSide) {
  auto r = Make(1, 48000, 48000, 1.0f, 0.5f, true);
  EXPECT_EQ(Resample(r.get(), Samples(4, 1000), 1, 8),
            (Samples{0, 0, 1000, 500, 1000, 500, 1000, 500}));
  EXPECT_EQ(Resample(r.get(), Samples(2, 1000), 1, 4), (Samples{1000, 500, 1000, 500}));
}

TEST(Order1Interpolation, HalfFrameRoundsTowardMinusInfinity) {
  // 24000 -> 48000 steps half a frame: the second output sits halfway
  // between the initial zero and input frame 0.
  const struct {
    int16_t newer;
    int16_t half;
  } cases[] = {{-1, -1}, {1000, 500}, {1, 0}, {-3, -2}, {32767, 16383}, {-32768, -16384}};
  for (const auto& c : cases) {
    auto r = Make(1, 48000, 24000);
    EXPECT_EQ(Resample(r.get(), {c.newer}, 1, 2), (Samples{0, c.half})) << c.newer;
  }
}

TEST(Order1Interpolation, FirstFramesFrom44100To48000) {
  auto r = Make(1, 48000, 44100);
  ASSERT_EQ(r->getPhaseIncrement(), 986500300u);
  // (older, newer, weight): (0, 1000, 0), (0, 1000, 30105),
  // (1000, -2000, 27443), (-2000, 3000, 24780), (3000, -4000, 22118).
  const Samples out = Resample(r.get(), {1000, -2000, 3000, -4000, 0}, 1, 5);
  EXPECT_EQ(out, (Samples{0, 918, -1513, 1781, -1725}));
  // Five output frames advanced 5 * 986500300 = 4 frames + 637534204.
  EXPECT_EQ(r->getPhaseFraction(), 637534204u);
}

TEST(Order1Downsampling, ThreeToOneTakesEveryThirdFrame) {
  auto r = Make(1, 16000, 48000);
  ASSERT_EQ(r->getPhaseIncrement(), 3221225472u);
  Samples in(480);
  for (int i = 0; i < 480; ++i) in[i] = static_cast<int16_t>(i * 7 - 1000);
  for (int block = 0; block < 2; ++block) {
    const Samples out = Resample(r.get(), in, 1, 160);
    EXPECT_EQ(out[0], block == 0 ? 0 : in[479]);
    for (int k = 1; k < 160; ++k) ASSERT_EQ(out[k], in[3 * k - 1]) << k;
    EXPECT_EQ(r->getPhaseFraction(), 0u);
  }
}

// Output frame 1 at equal rates is input frame 0 times the gain, added to
// what the output held.
TEST(Order1Mixing, ProductsTruncateSaturateAndSumsWrap) {
  const float inf = std::numeric_limits<float>::infinity();
  const struct {
    float gain;
    int16_t in;
    int16_t held;
    int16_t result;
  } cases[] = {
      {0.5f, -3, 0, -1}, {0.5f, 3, 0, 1},                 // toward zero
      {1.0f, 30000, 30000, -5536}, {1.0f, -30000, -30000, 5536},  // sums wrap
      {1e5f, 1000, 100, -7836},                           // 10^8 wraps
      // INT32_MAX adds 0xffff, INT32_MIN adds 0, NaN adds 0.
      {1e10f, 1000, 100, 99}, {inf, 1000, 100, 99}, {-1e10f, 1000, 100, 100},
      {-inf, 1000, 100, 100}, {std::numeric_limits<float>::quiet_NaN(), 1000, 100, 100},
  };
  for (const auto& c : cases) {
    for (int channels : {1, 2}) {
      auto r = Make(channels, 48000, 48000, c.gain, c.gain);
      const Samples in(2 * channels, c.in);
      const Samples out = Resample(r.get(), in, channels, 2 * channels, c.held);
      EXPECT_EQ(out[channels], c.result) << c.gain << " " << c.in << " " << channels;
    }
  }
}

TEST(Order1Blocks, EmptyBlockChangesNothing) {
  auto touched = Make(2, 48000, 44100);
  auto control = Make(2, 48000, 44100);
  const Samples first = {100, -100, 200, -200, 300, -300};
  EXPECT_EQ(Resample(touched.get(), first, 2, 6), Resample(control.get(), first, 2, 6));
  const uint32_t fraction = touched->getPhaseFraction();
  ASSERT_NE(fraction, 0u);
  Samples out(4, 42);
  touched->resample(out.data(), nullptr, 0);
  EXPECT_EQ(out, Samples(4, 42));
  EXPECT_EQ(touched->getPhaseFraction(), fraction);
  const Samples next = {-500, 500, 700, -700, 900, -900};
  EXPECT_EQ(Resample(touched.get(), next, 2, 8, 1), Resample(control.get(), next, 2, 8, 1));
}

TEST(Order1Blocks, UnsupportedChannelCountsAreNoOperations) {
  for (int channels : {0, 3, -1}) {
    testing::internal::CaptureStderr();
    std::unique_ptr<AudioResampler> r(
        AudioResampler::create(16, channels, 48000, AudioResampler::QUALITY_LOW, true));
    testing::internal::GetCapturedStderr();
    r->setVolume(1.0f, 1.0f);
    r->setSourceSampleRate(44100);
    const Samples in(30, 1000);
    Samples out(40, 5);
    r->resample(out.data(), in.data(), 10);
    EXPECT_EQ(out, Samples(40, 5));
    EXPECT_EQ(r->getPhaseFraction(), 0u);
  }
}

TEST(Order1Blocks, StopsAtTheEndOfTheInputWhenTheCarriedFractionIsLarge) {
  auto r = Make(1, 48000, 44100);
  // 34 frames leave the fraction at 1067030908.
  Resample(r.get(), Samples(34), 1, 37);
  ASSERT_GE(r->getPhaseFraction(), r->getPhaseIncrement());
  // floor(48000 * 12 / 44100) = 13 outputs are due, but the input runs out
  // after 12: the last element keeps its contents.
  const Samples in = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12};
  ASSERT_EQ(r->getOutputSampleCount(in.size()), 13u);
  const Samples out = Resample(r.get(), in, 1, 13, -7);
  EXPECT_NE(out[11], -7);
  EXPECT_EQ(out[12], -7);
}

// FNV-1a over bytes.
struct Digest {
  void Add(const void* data, size_t size) {
    const unsigned char* bytes = static_cast<const unsigned char*>(data);
    for (size_t i = 0; i < size; ++i) value = (value ^ bytes[i]) * 0x100000001b3u;
  }
  uint64_t value = 0xcbf29ce484222325u;
};

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
  Digest digest;
  for (int block = 0; block < 600; ++block) {
    switch (uniform(0, 9)) {
      case 0: {
        const int32_t rates[] = {outputRate, 3 * outputRate, 8000, 11025, 44100, 48000,
                                 uniform(outputRate / 8, 3 * outputRate)};
        r->setSourceSampleRate(std::min(rates[uniform(0, 6)], 3 * outputRate));
        break;
      }
      case 1: {
        const float left = std::uniform_real_distribution<float>(-3.0f, 3.0f)(random);
        r->setVolume(left, uniform(0, 3) == 0 ? 1.0f : left * 0.75f);
        break;
      }
      case 2:
        r->reset();
        break;
      default:
        break;
    }
    Samples in(static_cast<size_t>(uniform(0, 700)) * channels);
    for (int16_t& s : in) s = static_cast<int16_t>(uniform(-32768, 32767));
    Samples out(r->getOutputSampleCount(in.size() / channels) + 8);
    if (uniform(0, 1) == 1) {
      for (int16_t& s : out) s = static_cast<int16_t>(uniform(-32768, 32767));
    }
    r->resample(out.data(), in.data(), in.size() / channels);
    const uint32_t fraction = r->getPhaseFraction();
    digest.Add(out.data(), out.size() * sizeof(int16_t));
    digest.Add(&fraction, sizeof(fraction));
  }
  return digest.value;
}

TEST(Order1Stream, LongRandomStreamsKeepTheirDigests) {
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

// A stereo input of two equal channels gives on each side what the mono
// input gives. Where a block's outputs use up its input exactly (equal
// rates, or 3:1 on multiples of three frames), blocks of any size continue
// one another as one long block would.
TEST(Order1Stream, EqualChannelsActAsMonoAndBlocksJoin) {
  std::mt19937 random(7);
  Samples mono(20001);
  for (int16_t& s : mono) s = static_cast<int16_t>(random());
  Samples stereo(2 * mono.size());
  for (size_t i = 0; i < mono.size(); ++i) stereo[2 * i] = stereo[2 * i + 1] = mono[i];

  for (int32_t sourceRate : {44100, 48000, 144000}) {
    SCOPED_TRACE(sourceRate);
    auto whole = Make(2, 48000, sourceRate, 0.75f, -1.5f);
    const Samples expected =
        Resample(whole.get(), stereo, 2, whole->getOutputSampleCount(mono.size()));
    auto to_stereo = Make(1, 48000, sourceRate, 0.75f, -1.5f, true);
    EXPECT_EQ(Resample(to_stereo.get(), mono, 1, expected.size()), expected);
    if (sourceRate == 44100) continue;

    auto blocks = Make(2, 48000, sourceRate, 0.75f, -1.5f);
    Samples joined;
    for (size_t start = 0; start < mono.size();) {
      const size_t frames = std::min<size_t>(random() % 1000 * 3, mono.size() - start);
      const Samples in(stereo.begin() + 2 * start, stereo.begin() + 2 * (start + frames));
      const Samples out = Resample(blocks.get(), in, 2, blocks->getOutputSampleCount(frames));
      joined.insert(joined.end(), out.begin(), out.end());
      start += frames;
    }
    EXPECT_EQ(joined, expected);
  }
}

}  // namespace
}  // namespace norvane
