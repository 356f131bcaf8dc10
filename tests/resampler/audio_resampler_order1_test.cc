#include "resampler/audio_resampler_order1.h"

#include <gtest/gtest.h>

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

TEST(Order1Mixing, GainProductsTruncateTowardZeroAndSumsWrap) {
  auto r = Make(1, 48000, 48000, 0.5f);
  EXPECT_EQ(Resample(r.get(), {-3, 3, -3}, 1, 3), (Samples{0, -1, 1}));

  auto up = Make(1, 48000, 48000);
  EXPECT_EQ(Resample(up.get(), {30000, 0}, 1, 2, 30000), (Samples{30000, -5536}));
  auto down = Make(1, 48000, 48000);
  EXPECT_EQ(Resample(down.get(), {-30000, 0}, 1, 2, -30000), (Samples{-30000, 5536}));
}

TEST(Order1Mixing, OutOfRangeGainProductsSaturate) {
  const float inf = std::numeric_limits<float>::infinity();
  const struct {
    float gain;
    int16_t result;
  } cases[] = {
      // INT32_MAX adds 0xffff, INT32_MIN adds 0, NaN adds 0.
      {1e10f, 99}, {inf, 99}, {-1e10f, 100}, {-inf, 100},
      {std::numeric_limits<float>::quiet_NaN(), 100},
      // In range: 10^8 wraps to -7936.
      {1e5f, -7836},
  };
  for (const auto& c : cases) {
    auto r = Make(1, 48000, 48000, c.gain);
    EXPECT_EQ(Resample(r.get(), {1000, 0}, 1, 2, 100)[1], c.result) << c.gain;
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

// An independent model of the converter: one absolute 64-bit position per
// block, counted in 2^-30 frames from the previous block's last frame, which
// stands before the block as frame 0.
class Reference {
 public:
  Reference(int channels, bool stereoOutput, int32_t outputRate)
      : channels_(channels), outputs_(channels == 2 || stereoOutput ? 2 : 1),
        outputRate_(outputRate) {}

  void setSourceRate(int32_t rate) {
    sourceRate_ = rate;
    increment_ = (static_cast<uint64_t>(rate) << 30) / outputRate_;
  }
  void setGains(float left, float right) { gains_[0] = left; gains_[1] = right; }
  void reset() { position_ = 0; }
  uint64_t fraction() const { return position_; }

  size_t outputSamples(size_t frames) const {
    return outputs_ * static_cast<size_t>(uint64_t(outputRate_) * frames / sourceRate_);
  }

  void process(const Samples& in, Samples* out) {
    const size_t frames = in.size() / channels_;
    std::vector<int32_t> extended[2];
    for (int c = 0; c < channels_; ++c) {
      extended[c].push_back(last_[c]);
      for (size_t i = 0; i < frames; ++i) extended[c].push_back(in[i * channels_ + c]);
    }
    uint64_t position = position_;
    for (size_t o = 0; o < outputSamples(frames); o += outputs_) {
      const uint64_t frame = position >> 30;
      if (frame + 1 > frames) break;
      const double weight = static_cast<double>((position & ((1u << 30) - 1)) >> 15);
      for (int side = 0; side < outputs_; ++side) {
        const std::vector<int32_t>& x = extended[channels_ == 2 ? side : 0];
        const double step = static_cast<double>(x[frame + 1] - x[frame]) * weight / 32768.0;
        const int32_t value = x[frame] + static_cast<int32_t>(std::floor(step));
        const float product = static_cast<float>(value) * gains_[side];
        const int64_t sum = (*out)[o + side] + static_cast<int64_t>(std::trunc(product));
        const int64_t wrapped = ((sum % 65536) + 65536) % 65536;
        (*out)[o + side] = static_cast<int16_t>(wrapped >= 32768 ? wrapped - 65536 : wrapped);
      }
      position += increment_;
    }
    position_ = position & ((1u << 30) - 1);
    if (frames > 0) {
      for (int c = 0; c < channels_; ++c) last_[c] = extended[c].back();
    }
  }

 private:
  const int channels_;
  const int outputs_;
  const int32_t outputRate_;
  int32_t sourceRate_ = 0;
  uint64_t increment_ = 0;
  uint64_t position_ = 0;
  float gains_[2] = {1.0f, 1.0f};
  int32_t last_[2] = {0, 0};
};

TEST(Order1Stream, MatchesTheReferenceOverALongRandomStream) {
  std::mt19937 random(20240611);
  auto uniform = [&random](int lo, int hi) {
    return std::uniform_int_distribution<int>(lo, hi)(random);
  };
  const struct {
    int channels;
    bool stereoOutput;
    int32_t outputRate;
  } layouts[] = {{1, false, 48000}, {1, true, 44100}, {2, false, 16000}, {2, true, 48000}};
  for (const auto& layout : layouts) {
    SCOPED_TRACE(testing::Message() << layout.channels << " channels, stereo output "
                                    << layout.stereoOutput << ", " << layout.outputRate << " Hz");
    auto r = Make(layout.channels, layout.outputRate, layout.outputRate, 1.0f, 1.0f,
                  layout.stereoOutput);
    Reference model(layout.channels, layout.stereoOutput, layout.outputRate);
    model.setSourceRate(layout.outputRate);
    for (int block = 0; block < 600; ++block) {
      switch (uniform(0, 9)) {
        case 0: {
          const int32_t rates[] = {layout.outputRate, 3 * layout.outputRate, 8000, 11025,
                                   44100, 48000, uniform(layout.outputRate / 8,
                                                         3 * layout.outputRate)};
          int32_t rate = rates[uniform(0, 6)];
          if (rate > 3 * layout.outputRate) rate = 3 * layout.outputRate;
          r->setSourceSampleRate(rate);
          model.setSourceRate(rate);
          break;
        }
        case 1: {
          const float left = std::uniform_real_distribution<float>(-3.0f, 3.0f)(random);
          const float right = uniform(0, 3) == 0 ? 1.0f : left * 0.75f;
          r->setVolume(left, right);
          model.setGains(left, right);
          break;
        }
        case 2:
          r->reset();
          model.reset();
          break;
        default:
          break;
      }
      Samples in(static_cast<size_t>(uniform(0, 700)) * layout.channels);
      // Loud, jumpy input exercises the wrap-around and negative steps.
      for (int16_t& s : in) s = static_cast<int16_t>(uniform(-32768, 32767));
      const size_t count = model.outputSamples(in.size() / layout.channels);
      ASSERT_EQ(r->getOutputSampleCount(in.size() / layout.channels), count);
      Samples expected(count + 8);
      if (uniform(0, 1) == 1) {
        for (int16_t& s : expected) s = static_cast<int16_t>(uniform(-32768, 32767));
      }
      Samples actual = expected;
      r->resample(actual.data(), in.data(), in.size() / layout.channels);
      model.process(in, &expected);
      ASSERT_EQ(actual, expected) << "block " << block;
      ASSERT_EQ(r->getPhaseFraction(), model.fraction()) << "block " << block;
    }
  }
}

}  // namespace
}  // namespace norvane
