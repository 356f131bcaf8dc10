#include "jni/resampler_bridge.h"

#include <cstring>

#include "base/logging.h"

namespace resampler_bridge {
namespace {

using norvane::AudioResampler;

constexpr size_t kInstanceAt = 0;
constexpr size_t kChannelCountAt = 8;
constexpr size_t kStereoOutputAt = 12;
static_assert(sizeof(AudioResampler*) == 8, "the context layout assumes 64-bit pointers");

// Java may hand in a sliced buffer at any address, so fields are copied
// rather than accessed in place.
template <typename T>
T Load(const uint8_t* context, size_t at) {
  T value;
  std::memcpy(&value, context + at, sizeof(value));
  return value;
}

template <typename T>
void Store(uint8_t* context, size_t at, T value) {
  std::memcpy(context + at, &value, sizeof(value));
}

bool Usable(const uint8_t* context, int64_t capacity) {
  return context != nullptr && capacity >= kContextSize;
}

}  // namespace

void Create(uint8_t* context, int64_t capacity, int32_t bytesPerSample, int32_t channelCount,
            int32_t sampleRate, bool stereoOutput) {
  if (!Usable(context, capacity)) return;
  // Wrapping multiplication: an absurd sample size is logged as a bad format
  // by the core instead of overflowing here.
  const int bitDepth = static_cast<int>(static_cast<uint32_t>(bytesPerSample) * 8u);
  AudioResampler* resampler = AudioResampler::create(
      bitDepth, channelCount, sampleRate, AudioResampler::QUALITY_LOW, stereoOutput);
  Store(context, kInstanceAt, resampler);
  resampler->setVolume(1.0f, 1.0f);
  Store(context, kChannelCountAt, channelCount);
  Store<uint8_t>(context, kStereoOutputAt, stereoOutput ? 1 : 0);
}

AudioResampler* InstanceOf(const uint8_t* context, int64_t capacity) {
  if (!Usable(context, capacity)) return nullptr;
  AudioResampler* resampler = Load<AudioResampler*>(context, kInstanceAt);
  if (resampler == nullptr) return nullptr;
  // The instance is the one thing here the Java side cannot rewrite without
  // our knowing; fields that disagree with it mean the buffer was tampered
  // with, and bounds computed from them would be wrong.
  const int32_t channels = Load<int32_t>(context, kChannelCountAt);
  const uint8_t stereo = Load<uint8_t>(context, kStereoOutputAt);
  if (channels != resampler->getChannelCount() ||
      stereo != (resampler->isStereoOutput() ? 1 : 0)) {
    LOG(ERROR) << "Bad resampler context: it holds " << channels << " channels and stereo flag "
               << int{stereo} << ", its instance was made with " << resampler->getChannelCount()
               << " and " << int{resampler->isStereoOutput()} << ": call ignored.";
    return nullptr;
  }
  return resampler;
}

void Release(uint8_t* context, int64_t capacity) {
  AudioResampler* resampler = InstanceOf(context, capacity);
  if (resampler == nullptr) return;
  delete resampler;
  Store<AudioResampler*>(context, kInstanceAt, nullptr);
}

bool Plan(const AudioResampler& resampler, const Block& block, ResamplePlan* plan) {
  const int32_t channels = resampler.getChannelCount();
  if (channels <= 0) return false;
  // Widened to 64 bits, so that no product below can overflow.
  if (block.inputOffset < 0 || block.inputLength < 0 ||
      block.inputOffset + 2 * int64_t{block.inputLength} > block.inputBytes) {
    LOG(ERROR) << "Resampler input of " << block.inputLength << " samples at byte "
               << block.inputOffset << " exceeds the " << block.inputBytes
               << " bytes given: nothing resampled.";
    return false;
  }
  plan->inputFrames = static_cast<size_t>(block.inputLength / channels);
  const int64_t samplesPerFrame = resampler.isStereoOutput() ? 2 : channels;
  const int64_t clearBytes =
      block.accumulate ? 0 : int64_t{block.outputFrameCount} * 2 * samplesPerFrame;
  const uint64_t writtenBytes = 2 * resampler.getOutputSampleCount(plan->inputFrames);
  if ((!block.accumulate && block.outputFrameCount < 0) || clearBytes > block.outputBytes ||
      writtenBytes > static_cast<uint64_t>(block.outputBytes)) {
    LOG(ERROR) << "Resampler output of " << block.outputBytes << " bytes is too small for "
               << clearBytes << " bytes to clear and " << writtenBytes
               << " bytes to resample: nothing resampled.";
    return false;
  }
  plan->clearBytes = static_cast<size_t>(clearBytes);
  return true;
}

void Run(AudioResampler* resampler, const ResamplePlan& plan, const uint8_t* input,
         int32_t inputOffset, uint8_t* output) {
  std::memset(output, 0, plan.clearBytes);
  resampler->resample(reinterpret_cast<int16_t*>(output),
                      reinterpret_cast<const int16_t*>(input + inputOffset), plan.inputFrames);
}

}  // namespace resampler_bridge
