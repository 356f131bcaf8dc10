// What the resampler's JNI entries do, without JNI types, so that the checks
// can be driven by a fuzzer without a JVM. The entries in
// audio_resampler_jni.cc only fetch addresses and lengths and call these.
//
// The context is the 16-byte block the Java side keeps in a direct buffer:
// bytes 0-7 the instance, 8-11 its channel count, 12 its stereo flag (0 or 1),
// 13-15 reserved, in native byte order at any alignment.
#ifndef CLIPWEAVER_JNI_RESAMPLER_BRIDGE_H_
#define CLIPWEAVER_JNI_RESAMPLER_BRIDGE_H_

#include <cstddef>
#include <cstdint>

#include "resampler/audio_resampler.h"

namespace resampler_bridge {

constexpr int32_t kContextSize = 16;

// Builds an instance into a context of at least kContextSize bytes (null or
// shorter: nothing is done). An instance already there is overwritten.
void Create(uint8_t* context, int64_t capacity, int32_t bytesPerSample, int32_t channelCount,
            int32_t sampleRate, bool stereoOutput);

// The instance of a context, or null: for a missing or short buffer and
// after release, silently; for stored fields that disagree with the
// instance's own, with one error line.
norvane::AudioResampler* InstanceOf(const uint8_t* context, int64_t capacity);

// Destroys the instance and clears the pointer, so that later calls find
// nothing to use.
void Release(uint8_t* context, int64_t capacity);

// One resample call, checked before anything is read or written.
struct Block {
  int64_t inputBytes;  // of the whole input array or buffer
  int32_t inputOffset;  // bytes
  int32_t inputLength;  // samples of all channels
  int64_t outputBytes;
  int32_t outputFrameCount;  // frames to clear unless accumulating
  bool accumulate;
};

struct ResamplePlan {
  size_t inputFrames;
  size_t clearBytes;
};

// False, with one error line, when the block would read or write outside
// the sizes given; the bounds come from the instance's channel count and
// output layout. A zero-channel instance is refused silently.
bool Plan(const norvane::AudioResampler& resampler, const Block& block, ResamplePlan* plan);

// Clears and mixes into output as planned; input is the array's start.
void Run(norvane::AudioResampler* resampler, const ResamplePlan& plan, const uint8_t* input,
         int32_t inputOffset, uint8_t* output);

}  // namespace resampler_bridge

#endif  // CLIPWEAVER_JNI_RESAMPLER_BRIDGE_H_
