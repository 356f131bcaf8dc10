#include "resampler/audio_resampler_order1.h"

#include <cmath>
#include <cstring>
#include <limits>

#include "resampler/stereo_frame.h"

namespace norvane {
namespace {

// The binding hands in byte offsets into Java buffers, so input samples may
// sit at odd addresses.
int32_t LoadSample(const int16_t* in, size_t index) {
  int16_t sample;
  std::memcpy(&sample, reinterpret_cast<const char*>(in) + 2 * index, sizeof(sample));
  return sample;
}

// Weight from the top 15 fraction bits; the arithmetic shift rounds negative
// steps toward minus infinity.
int32_t Interpolate(int32_t older, int32_t newer, uint32_t fraction) {
  return older + (((newer - older) * static_cast<int32_t>(fraction >> 15)) >> 15);
}

// Huge gains saturate instead of leaving the conversion undefined.
int32_t TruncateSaturated(float x) {
  if (x >= 2147483648.0f) return std::numeric_limits<int32_t>::max();
  if (x >= -2147483648.0f) return static_cast<int32_t>(x);
  return x < 0 ? std::numeric_limits<int32_t>::min() : 0;  // NaN lands here
}

// No clamping: the sum wraps modulo 2^16.
void Mix(int16_t* out, int32_t value, float gain) {
  const uint32_t sum = static_cast<uint32_t>(*out) +
                       static_cast<uint32_t>(TruncateSaturated(static_cast<float>(value) * gain));
  *out = static_cast<int16_t>(static_cast<uint16_t>(sum));
}

}  // namespace

AudioResamplerOrder1::AudioResamplerOrder1(int bitDepth, int channelCount,
                                           int32_t sampleRate, src_quality quality,
                                           bool stereoOutput)
    : AudioResampler(bitDepth, channelCount, sampleRate, quality, stereoOutput) {}

void AudioResamplerOrder1::resample(int16_t* out, const int16_t* in,
                                    size_t inputFrameCount) {
  if (channelCount != 1 && channelCount != 2) return;
  if (!checkRates()) return;
  const uint64_t samples = getOutputSampleCount(inputFrameCount);
  if (channelCount == 2) {
    resampleLayout<2, true>(out, in, inputFrameCount, samples);
  } else if (stereoOutput) {
    resampleLayout<1, true>(out, in, inputFrameCount, samples);
  } else {
    resampleLayout<1, false>(out, in, inputFrameCount, samples);
  }
}

template <int kInputChannels, bool kTwoOutputs>
void AudioResamplerOrder1::resampleLayout(int16_t* out, const int16_t* in,
                                          size_t inputFrameCount,
                                          uint64_t outputSampleCount) {
  const uint32_t increment = phaseIncrement;
  const float left = leftVolume;
  const float right = rightVolume;
  uint32_t fraction = phaseFraction;
  size_t index = 0;
  uint64_t o = 0;
  // Gains whose products convert exactly let past the first input frame
  // take the one-register path.
  const bool exactGains = std::fabs(left) < 65536.0f && std::fabs(right) < 65536.0f;
  const StereoGains gains(left, right);
  while (o < outputSampleCount) {
    if (kInputChannels == 2 && index > 0 && exactGains) {
      for (; o < outputSampleCount && index < inputFrameCount; o += 2) {
        MixStereoFrame(out + o, in, 2 * (index - 1), fraction, gains);
        fraction += increment;
        index += fraction >> kFractionBits;
        fraction &= kFractionMask;
      }
      break;
    }
    int32_t olderLeft;
    int32_t olderRight = 0;
    if (index == 0) {
      olderLeft = lastLeftSample;
      olderRight = lastRightSample;
    } else if (index < inputFrameCount) {
      olderLeft = LoadSample(in, (index - 1) * kInputChannels);
      if (kInputChannels == 2) olderRight = LoadSample(in, (index - 1) * 2 + 1);
    } else {
      break;
    }
    const int32_t value = Interpolate(olderLeft, LoadSample(in, index * kInputChannels), fraction);
    Mix(out + o, value, left);
    if (kInputChannels == 2) {
      Mix(out + o + 1, Interpolate(olderRight, LoadSample(in, index * 2 + 1), fraction), right);
    } else if (kTwoOutputs) {
      Mix(out + o + 1, value, right);
    }
    o += kTwoOutputs ? 2 : 1;
    fraction += increment;
    index += fraction >> kFractionBits;
    fraction &= kFractionMask;
  }
  phaseFraction = fraction;
  if (inputFrameCount > 0) {
    lastLeftSample = LoadSample(in, (inputFrameCount - 1) * kInputChannels);
    if (kInputChannels == 2) lastRightSample = LoadSample(in, (inputFrameCount - 1) * 2 + 1);
  }
}

}  // namespace norvane
