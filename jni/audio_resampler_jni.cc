// JNI bridge of com.quilby.norvane.apps.clipweaver.media.audio.AudioResampler.
// The Java side owns a direct buffer holding a NativeResamplerContext; every
// call finds its resampler there. Nothing here throws a Java exception, and
// no call reads or writes outside the Java arrays and buffers it is given.
#include <jni.h>

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "base/logging.h"
#include "resampler/audio_resampler.h"

namespace {

struct NativeResamplerContext {
  norvane::AudioResampler* resampler;
  int32_t channelCount;
  int8_t stereoOutput;
  // Bytes 13 to 15 are reserved: never written or read.
};
static_assert(sizeof(void*) == 8, "the context layout assumes 64-bit pointers");
static_assert(offsetof(NativeResamplerContext, resampler) == 0, "layout");
static_assert(offsetof(NativeResamplerContext, channelCount) == 8, "layout");
static_assert(offsetof(NativeResamplerContext, stereoOutput) == 12, "layout");
static_assert(sizeof(NativeResamplerContext) == 16, "layout");

// A view of the context bytes. Java may hand in a sliced buffer at any
// address, so fields are copied rather than accessed in place.
class Context {
 public:
  // Null when the buffer is missing, not direct or too short.
  static Context Open(JNIEnv* env, jobject buffer) {
    if (env == nullptr || buffer == nullptr) return Context(nullptr);
    auto* bytes = static_cast<uint8_t*>(env->GetDirectBufferAddress(buffer));
    if (bytes == nullptr ||
        env->GetDirectBufferCapacity(buffer) < static_cast<jlong>(sizeof(NativeResamplerContext))) {
      return Context(nullptr);
    }
    return Context(bytes);
  }

  bool valid() const { return bytes_ != nullptr; }

  norvane::AudioResampler* resampler() const {
    norvane::AudioResampler* resampler;
    std::memcpy(&resampler, bytes_ + offsetof(NativeResamplerContext, resampler), sizeof(resampler));
    return resampler;
  }
  int32_t channelCount() const {
    int32_t count;
    std::memcpy(&count, bytes_ + offsetof(NativeResamplerContext, channelCount), sizeof(count));
    return count;
  }
  bool stereoOutput() const {
    return bytes_[offsetof(NativeResamplerContext, stereoOutput)] != 0;
  }

  void setResampler(norvane::AudioResampler* resampler) {
    std::memcpy(bytes_ + offsetof(NativeResamplerContext, resampler), &resampler, sizeof(resampler));
  }
  void setChannelCount(int32_t count) {
    std::memcpy(bytes_ + offsetof(NativeResamplerContext, channelCount), &count, sizeof(count));
  }
  void setStereoOutput(bool stereo) {
    bytes_[offsetof(NativeResamplerContext, stereoOutput)] = stereo ? 1 : 0;
  }

 private:
  explicit Context(uint8_t* bytes) : bytes_(bytes) {}
  uint8_t* bytes_;
};

// The resampler of a usable context, or null.
norvane::AudioResampler* ResamplerOf(const Context& context) {
  return context.valid() ? context.resampler() : nullptr;
}

// What one resample call will do, checked against the Java arrays before any
// of them is touched.
struct ResamplePlan {
  norvane::AudioResampler* resampler;
  int32_t clearBytes;
  size_t inputFrames;
};

// Logs one error and returns false when the call would read or write out of
// bounds. Counts are widened to 64 bits, so no product can overflow.
bool PlanResample(const Context& context, int64_t inputBytes, jint inputOffset,
                  jint inputLength, jsize outputBytes, jint outputFrameCount,
                  bool accumulate, ResamplePlan* plan) {
  plan->resampler = ResamplerOf(context);
  if (plan->resampler == nullptr) return false;
  const int32_t channels = context.channelCount();
  if (channels <= 0) return false;
  if (inputOffset < 0 || inputLength < 0 ||
      inputOffset + 2 * static_cast<int64_t>(inputLength) > inputBytes) {
    LOG(ERROR) << "Resampler input of " << inputLength << " samples at byte "
               << inputOffset << " exceeds the " << inputBytes << " bytes given: nothing resampled.";
    return false;
  }
  plan->inputFrames = static_cast<size_t>(inputLength / channels);
  const int64_t samplesPerFrame = context.stereoOutput() ? 2 : channels;
  const int64_t clearBytes = accumulate ? 0 : int64_t{outputFrameCount} * 2 * samplesPerFrame;
  const uint64_t writtenBytes = 2 * plan->resampler->getOutputSampleCount(plan->inputFrames);
  if ((!accumulate && outputFrameCount < 0) || clearBytes > outputBytes ||
      writtenBytes > static_cast<uint64_t>(outputBytes)) {
    LOG(ERROR) << "Resampler output of " << outputBytes << " bytes is too small for "
               << clearBytes << " bytes to clear and " << writtenBytes
               << " bytes to resample: nothing resampled.";
    return false;
  }
  plan->clearBytes = static_cast<int32_t>(clearBytes);
  return true;
}

void ResampleIntoByteArray(JNIEnv* env, const ResamplePlan& plan, const uint8_t* input,
                           jbyteArray output) {
  jbyte* out = env->GetByteArrayElements(output, nullptr);
  if (out == nullptr) return;
  std::memset(out, 0, static_cast<size_t>(plan.clearBytes));
  plan.resampler->resample(reinterpret_cast<int16_t*>(out),
                           reinterpret_cast<const int16_t*>(input), plan.inputFrames);
  env->ReleaseByteArrayElements(output, out, 0);
}

}  // namespace

extern "C" JNIEXPORT jint JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_getNativeResamplerContextSize(
    JNIEnv*, jobject) {
  return static_cast<jint>(sizeof(NativeResamplerContext));
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_createNativeResampler(
    JNIEnv* env, jobject, jobject contextBuffer, jint bytesPerSample, jint channelCount,
    jint sampleRate, jboolean stereoOutput) {
  Context context = Context::Open(env, contextBuffer);
  if (!context.valid()) return;
  // Wrapping multiplication: an absurd sample size is logged as a bad
  // format by the core instead of overflowing here.
  const int bitDepth = static_cast<int>(static_cast<uint32_t>(bytesPerSample) * 8u);
  norvane::AudioResampler* resampler = norvane::AudioResampler::create(
      bitDepth, channelCount, sampleRate, norvane::AudioResampler::QUALITY_LOW,
      stereoOutput != JNI_FALSE);
  context.setResampler(resampler);
  resampler->setVolume(1.0f, 1.0f);
  context.setChannelCount(channelCount);
  context.setStereoOutput(stereoOutput != JNI_FALSE);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_setVolume(
    JNIEnv* env, jobject, jobject contextBuffer, jfloat left, jfloat right) {
  norvane::AudioResampler* resampler = ResamplerOf(Context::Open(env, contextBuffer));
  if (resampler != nullptr) resampler->setVolume(left, right);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_setSourceSampleRate(
    JNIEnv* env, jobject, jobject contextBuffer, jint sampleRate) {
  norvane::AudioResampler* resampler = ResamplerOf(Context::Open(env, contextBuffer));
  if (resampler != nullptr) resampler->setSourceSampleRate(sampleRate);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_resampleFromByteArray(
    JNIEnv* env, jobject, jobject contextBuffer, jbyteArray input, jint inputOffset,
    jint inputLength, jbyteArray output, jint outputFrameCount, jboolean accumulate) {
  const Context context = Context::Open(env, contextBuffer);
  if (!context.valid() || input == nullptr || output == nullptr) return;
  ResamplePlan plan;
  if (!PlanResample(context, env->GetArrayLength(input), inputOffset, inputLength,
                    env->GetArrayLength(output), outputFrameCount, accumulate != JNI_FALSE,
                    &plan)) {
    return;
  }
  jbyte* in = env->GetByteArrayElements(input, nullptr);
  if (in == nullptr) return;
  ResampleIntoByteArray(env, plan, reinterpret_cast<const uint8_t*>(in) + inputOffset, output);
  env->ReleaseByteArrayElements(input, in, JNI_ABORT);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_resampleFromByteBuffer(
    JNIEnv* env, jobject, jobject contextBuffer, jobject input, jint inputOffset,
    jint inputLength, jbyteArray output, jint outputFrameCount, jboolean accumulate) {
  const Context context = Context::Open(env, contextBuffer);
  if (!context.valid() || input == nullptr || output == nullptr) return;
  const auto* in = static_cast<const uint8_t*>(env->GetDirectBufferAddress(input));
  if (in == nullptr) return;
  ResamplePlan plan;
  if (!PlanResample(context, env->GetDirectBufferCapacity(input), inputOffset, inputLength,
                    env->GetArrayLength(output), outputFrameCount, accumulate != JNI_FALSE,
                    &plan)) {
    return;
  }
  ResampleIntoByteArray(env, plan, in + inputOffset, output);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_releaseNativeResampler(
    JNIEnv* env, jobject, jobject contextBuffer) {
  Context context = Context::Open(env, contextBuffer);
  norvane::AudioResampler* resampler = ResamplerOf(context);
  if (resampler == nullptr) return;
  delete resampler;
  // A second release, or any call after this one, finds nothing to use.
  context.setResampler(nullptr);
}
