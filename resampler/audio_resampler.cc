#include "resampler/audio_resampler.h"

#include <pthread.h>

#include <limits>

#include "base/platform_log.h"
#include "resampler/audio_resampler_order1.h"

namespace norvane {
namespace {

constexpr char kTag[] = "AudioResampler";
// Written out rather than taken from the compiler, whose spelling varies.
constexpr char kCreateSignature[] =
    "static norvane::AudioResampler *norvane::AudioResampler::create(int, "
    "int, int32_t, norvane::AudioResampler::src_quality, bool)";

constexpr uint32_t kMaxLoadMHz = 130;

pthread_mutex_t loadLock = PTHREAD_MUTEX_INITIALIZER;
uint32_t currentLoadMHz = 0;

pthread_once_t defaultQualityOnce = PTHREAD_ONCE_INIT;
bool defaultQualityIsVeryHigh = false;

// Nothing configures the default here, so it is the best quality there is.
void resolveDefaultQuality() { defaultQualityIsVeryHigh = true; }

uint32_t qualityCostMHz(AudioResampler::src_quality quality) {
  switch (quality) {
    case AudioResampler::QUALITY_MEDIUM:
    case AudioResampler::QUALITY_HIGH:
    case AudioResampler::QUALITY_VERY_HIGH:
      return 6 + (quality - 2) * 14;
    default:
      return 3;
  }
}

}  // namespace

AudioResampler* AudioResampler::create(int bitDepth, int channelCount,
                                       int32_t sampleRate, src_quality quality,
                                       bool stereoOutput) {
  bool atFinalQuality = true;
  if (quality == QUALITY_DEFAULT) {
    const int error = pthread_once(&defaultQualityOnce, resolveDefaultQuality);
    if (error != 0) {
      platform_log::Print(platform_log::kError, kTag, "%s pthread_once failed: %d",
                          kCreateSignature, error);
    }
    quality = defaultQualityIsVeryHigh ? QUALITY_VERY_HIGH : QUALITY_DEFAULT;
    atFinalQuality = false;
  }

  pthread_mutex_lock(&loadLock);
  for (;;) {
    const uint32_t newLoad = currentLoadMHz + qualityCostMHz(quality);
    if (atFinalQuality || (static_cast<uint32_t>(quality) <= QUALITY_VERY_HIGH &&
                           newLoad <= kMaxLoadMHz)) {
      currentLoadMHz = newLoad;
      break;
    }
    switch (quality) {
      case QUALITY_VERY_HIGH: quality = QUALITY_HIGH; break;
      case QUALITY_HIGH: quality = QUALITY_MEDIUM; break;
      case QUALITY_MEDIUM: quality = QUALITY_LOW; break;
      default: atFinalQuality = true; break;
    }
  }
  pthread_mutex_unlock(&loadLock);

  AudioResampler* resampler = new AudioResamplerOrder1(
      bitDepth, channelCount, sampleRate, quality, stereoOutput);
  resampler->initialize();
  return resampler;
}

AudioResampler::AudioResampler(int bitDepth, int channelCount,
                               int32_t sampleRate, src_quality quality,
                               bool stereoOutput)
    : bitDepth(bitDepth),
      channelCount(channelCount),
      outputSampleRate(sampleRate),
      stereoOutput(stereoOutput),
      inputSampleRate(sampleRate),
      leftVolume(0.0f),
      rightVolume(0.0f),
      // Equal rates until told otherwise, so a block resampled before
      // setSourceSampleRate passes through instead of stalling.
      phaseIncrement(sampleRate > 0 ? 1u << kFractionBits : 0),
      phaseFraction(0),
      localTimeFrequency(0),
      presentationTime(std::numeric_limits<int64_t>::max()),
      quality(quality) {
  if (bitDepth != 16 || (channelCount != 1 && channelCount != 2)) {
    platform_log::Print(platform_log::kError, kTag,
                        "Unsupported sample format, %d bits, %d channels",
                        bitDepth, channelCount);
  }
  if (sampleRate <= 0) {
    platform_log::Print(platform_log::kError, kTag, "Unsupported sample rate %d Hz",
                        sampleRate);
  }
}

AudioResampler::~AudioResampler() {
  pthread_mutex_lock(&loadLock);
  const int32_t newMHz =
      static_cast<int32_t>(currentLoadMHz - qualityCostMHz(quality));
  if (newMHz < 0) {
    platform_log::Assert("newMHz < 0", kTag, "negative resampler load %d MHz", newMHz);
  }
  currentLoadMHz = static_cast<uint32_t>(newMHz);
  pthread_mutex_unlock(&loadLock);
}

void AudioResampler::setSourceSampleRate(int32_t rate) {
  inputSampleRate = rate;
  phaseIncrement = ratesSupported(rate, outputSampleRate)
                       ? static_cast<uint32_t>(static_cast<double>(rate) *
                                               1073741824.0 / outputSampleRate)
                       : 0;
}

void AudioResampler::setVolume(float left, float right) {
  leftVolume = left;
  rightVolume = right;
}

void AudioResampler::setLocalTimeFrequency(uint64_t frequency) {
  localTimeFrequency = frequency;
}

void AudioResampler::setPresentationTime(int64_t time) { presentationTime = time; }

void AudioResampler::reset() { phaseFraction = 0; }

bool AudioResampler::ratesSupported(int32_t inputRate, int32_t outputRate) {
  return inputRate > 0 && outputRate > 0 &&
         static_cast<int64_t>(inputRate) <= kMaxRateRatio * static_cast<int64_t>(outputRate);
}

uint64_t AudioResampler::outputFrameCount(int32_t inputRate, int32_t outputRate,
                                          uint64_t inputFrameCount) {
  if (!ratesSupported(inputRate, outputRate)) return 0;
  return static_cast<uint64_t>(outputRate) * inputFrameCount / static_cast<uint64_t>(inputRate);
}

uint64_t AudioResampler::getOutputSampleCount(size_t inputFrameCount) const {
  if (channelCount != 1 && channelCount != 2) return 0;
  const uint64_t frames = outputFrameCount(inputSampleRate, outputSampleRate, inputFrameCount);
  return channelCount == 2 || stereoOutput ? 2 * frames : frames;
}

uint32_t AudioResampler::getCurrentLoadMHz() {
  pthread_mutex_lock(&loadLock);
  const uint32_t load = currentLoadMHz;
  pthread_mutex_unlock(&loadLock);
  return load;
}

bool AudioResampler::checkRates() {
  if (ratesSupported(inputSampleRate, outputSampleRate)) return true;
  if (!rateErrorLogged) {
    platform_log::Print(platform_log::kError, kTag,
                        "Unsupported resampling from %d Hz to %d Hz: no output",
                        inputSampleRate, outputSampleRate);
    rateErrorLogged = true;
  }
  return false;
}

}  // namespace norvane
