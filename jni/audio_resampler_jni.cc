// JNI bridge of com.quilby.norvane.apps.clipweaver.media.audio.AudioResampler:
// each entry fetches the addresses and lengths of its Java arguments and
// leaves the rest to resampler_bridge. Nothing here throws a Java exception,
// and no call reads or writes outside the Java arrays and buffers it is given.
#include <jni.h>

#include <cstdint>

#include "jni/resampler_bridge.h"

namespace {

struct DirectBuffer {
  uint8_t* bytes = nullptr;
  int64_t capacity = 0;
};

// A null or heap buffer gives no bytes.
DirectBuffer Direct(JNIEnv* env, jobject buffer) {
  DirectBuffer direct;
  if (env == nullptr || buffer == nullptr) return direct;
  direct.bytes = static_cast<uint8_t*>(env->GetDirectBufferAddress(buffer));
  if (direct.bytes != nullptr) direct.capacity = env->GetDirectBufferCapacity(buffer);
  return direct;
}

norvane::AudioResampler* InstanceOf(JNIEnv* env, jobject context) {
  const DirectBuffer buffer = Direct(env, context);
  return resampler_bridge::InstanceOf(buffer.bytes, buffer.capacity);
}

void ResampleInto(JNIEnv* env, norvane::AudioResampler* resampler,
                  const resampler_bridge::ResamplePlan& plan, const uint8_t* input,
                  jint inputOffset, jbyteArray output) {
  jbyte* out = env->GetByteArrayElements(output, nullptr);
  if (out == nullptr) return;
  resampler_bridge::Run(resampler, plan, input, inputOffset, reinterpret_cast<uint8_t*>(out));
  env->ReleaseByteArrayElements(output, out, 0);
}

}  // namespace

extern "C" JNIEXPORT jint JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_getNativeResamplerContextSize(
    JNIEnv*, jobject) {
  return resampler_bridge::kContextSize;
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_createNativeResampler(
    JNIEnv* env, jobject, jobject contextBuffer, jint bytesPerSample, jint channelCount,
    jint sampleRate, jboolean stereoOutput) {
  const DirectBuffer context = Direct(env, contextBuffer);
  resampler_bridge::Create(context.bytes, context.capacity, bytesPerSample, channelCount,
                           sampleRate, stereoOutput != JNI_FALSE);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_setVolume(
    JNIEnv* env, jobject, jobject contextBuffer, jfloat left, jfloat right) {
  norvane::AudioResampler* resampler = InstanceOf(env, contextBuffer);
  if (resampler != nullptr) resampler->setVolume(left, right);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_setSourceSampleRate(
    JNIEnv* env, jobject, jobject contextBuffer, jint sampleRate) {
  norvane::AudioResampler* resampler = InstanceOf(env, contextBuffer);
  if (resampler != nullptr) resampler->setSourceSampleRate(sampleRate);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_resampleFromByteArray(
    JNIEnv* env, jobject, jobject contextBuffer, jbyteArray input, jint inputOffset,
    jint inputLength, jbyteArray output, jint outputFrameCount, jboolean accumulate) {
  if (input == nullptr || output == nullptr) return;
  norvane::AudioResampler* resampler = InstanceOf(env, contextBuffer);
  resampler_bridge::ResamplePlan plan;
  if (resampler == nullptr ||
      !resampler_bridge::Plan(*resampler,
                              {env->GetArrayLength(input), inputOffset, inputLength,
                               env->GetArrayLength(output), outputFrameCount,
                               accumulate != JNI_FALSE},
                              &plan)) {
    return;
  }
  jbyte* in = env->GetByteArrayElements(input, nullptr);
  if (in == nullptr) return;
  ResampleInto(env, resampler, plan, reinterpret_cast<const uint8_t*>(in), inputOffset, output);
  env->ReleaseByteArrayElements(input, in, JNI_ABORT);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_resampleFromByteBuffer(
    JNIEnv* env, jobject, jobject contextBuffer, jobject input, jint inputOffset,
    jint inputLength, jbyteArray output, jint outputFrameCount, jboolean accumulate) {
  if (output == nullptr) return;
  const DirectBuffer in = Direct(env, input);
  if (in.bytes == nullptr) return;
  norvane::AudioResampler* resampler = InstanceOf(env, contextBuffer);
  resampler_bridge::ResamplePlan plan;
  if (resampler == nullptr ||
      !resampler_bridge::Plan(*resampler,
                              {in.capacity, inputOffset, inputLength, env->GetArrayLength(output),
                               outputFrameCount, accumulate != JNI_FALSE},
                              &plan)) {
    return;
  }
  ResampleInto(env, resampler, plan, in.bytes, inputOffset, output);
}

extern "C" JNIEXPORT void JNICALL
Java_com_quilby_norvane_apps_clipweaver_media_audio_AudioResampler_releaseNativeResampler(
    JNIEnv* env, jobject, jobject contextBuffer) {
  const DirectBuffer context = Direct(env, contextBuffer);
  resampler_bridge::Release(context.bytes, context.capacity);
}
