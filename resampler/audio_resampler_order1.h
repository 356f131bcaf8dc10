// Linear-interpolation resampler. The fractional read position and the last
// input frame carry over from one resample() call to the next, so the first
// outputs of a block interpolate from the previous block's last frame.
#ifndef CLIPWEAVER_RESAMPLER_AUDIO_RESAMPLER_ORDER1_H_
#define CLIPWEAVER_RESAMPLER_AUDIO_RESAMPLER_ORDER1_H_

#include <cstddef>
#include <cstdint>

#include "resampler/audio_resampler.h"

namespace norvane {

class AudioResamplerOrder1 : public AudioResampler {
 public:
  // Use AudioResampler::create, which accounts for the load this releases.
  AudioResamplerOrder1(int bitDepth, int channelCount, int32_t sampleRate,
                       src_quality quality, bool stereoOutput);

  void initialize() override {}
  // `in` need not be 2-byte aligned.
  void resample(int16_t* out, const int16_t* in, size_t inputFrameCount) override;

 private:
  template <int kInputChannels, bool kTwoOutputs>
  void resampleLayout(int16_t* out, const int16_t* in, size_t inputFrameCount,
                      uint64_t outputSampleCount);

  int32_t lastLeftSample = 0;
  int32_t lastRightSample = 0;
};

}  // namespace norvane

#endif  // CLIPWEAVER_RESAMPLER_AUDIO_RESAMPLER_ORDER1_H_
