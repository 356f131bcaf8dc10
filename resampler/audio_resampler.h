// Sample-rate converter for interleaved 16-bit PCM: converts blocks from a
// source rate to a fixed output rate, applies a float gain per output channel
// and mixes into a 16-bit output buffer.
//
// Every instance draws on a process-wide load budget (in MHz) for its
// lifetime. One instance must be driven by one thread at a time; create and
// destruction may run on any thread.
#ifndef CLIPWEAVER_RESAMPLER_AUDIO_RESAMPLER_H_
#define CLIPWEAVER_RESAMPLER_AUDIO_RESAMPLER_H_

#include <cstddef>
#include <cstdint>

namespace norvane {

class AudioResampler {
 public:
  enum src_quality : int32_t {
    QUALITY_DEFAULT = 0,
    QUALITY_LOW = 1,
    QUALITY_MEDIUM = 2,
    QUALITY_HIGH = 3,
    QUALITY_VERY_HIGH = 4,
  };

  // Returns a new instance owned by the caller (delete it). sampleRate is the
  // output rate and the initial source rate. QUALITY_DEFAULT may settle on a
  // lower quality when the load budget is short; any other quality is taken
  // as given even beyond the budget. Unsupported formats and rates are
  // logged, and the instance is built all the same.
  static AudioResampler* create(int bitDepth, int channelCount,
                                int32_t sampleRate, src_quality quality,
                                bool stereoOutput);

  virtual ~AudioResampler();

  virtual void initialize() = 0;
  virtual void setSourceSampleRate(int32_t rate);
  virtual void setVolume(float left, float right);
  virtual void setLocalTimeFrequency(uint64_t frequency);
  virtual void setPresentationTime(int64_t time);
  // Mixes into `out`, which must hold getOutputSampleCount(inputFrameCount)
  // samples. The stream continues from the previous call.
  virtual void resample(int16_t* out, const int16_t* in,
                        size_t inputFrameCount) = 0;
  virtual void reset();

  // The largest source rate, as a multiple of the output rate: beyond it the
  // 30-bit phase plus its increment would not fit 32 bits.
  static constexpr int kMaxRateRatio = 3;
  static bool ratesSupported(int32_t inputRate, int32_t outputRate);
  // Frames a block of inputFrameCount frames yields at most:
  // floor(outputRate * inputFrameCount / inputRate), 0 for unsupported rates.
  static uint64_t outputFrameCount(int32_t inputRate, int32_t outputRate,
                                   uint64_t inputFrameCount);

  // Samples (not frames) that resample() writes at most for this many input
  // frames with the current rates; 0 when it would write nothing.
  uint64_t getOutputSampleCount(size_t inputFrameCount) const;

  int32_t getChannelCount() const { return channelCount; }
  bool isStereoOutput() const { return stereoOutput; }
  int32_t getInputSampleRate() const { return inputSampleRate; }
  int32_t getOutputSampleRate() const { return outputSampleRate; }
  float getLeftVolume() const { return leftVolume; }
  float getRightVolume() const { return rightVolume; }
  uint32_t getPhaseIncrement() const { return phaseIncrement; }
  uint32_t getPhaseFraction() const { return phaseFraction; }

  // Sum of the costs of the live instances.
  static uint32_t getCurrentLoadMHz();

  AudioResampler(const AudioResampler&) = delete;
  AudioResampler& operator=(const AudioResampler&) = delete;

 protected:
  static constexpr int kFractionBits = 30;
  static constexpr uint32_t kFractionMask = (1u << kFractionBits) - 1;

  AudioResampler(int bitDepth, int channelCount, int32_t sampleRate,
                 src_quality quality, bool stereoOutput);

  // False (and one error line per instance) when the current rates give no
  // usable phase increment.
  bool checkRates();

  const int32_t bitDepth;
  const int32_t channelCount;
  const int32_t outputSampleRate;
  const bool stereoOutput;
  int32_t inputSampleRate;
  float leftVolume;
  float rightVolume;
  uint32_t phaseIncrement;
  uint32_t phaseFraction;
  uint64_t localTimeFrequency;
  int64_t presentationTime;
  // Its cost is what destruction gives back to the budget.
  const src_quality quality;

 private:
  bool rateErrorLogged = false;
};

}  // namespace norvane

#endif  // CLIPWEAVER_RESAMPLER_AUDIO_RESAMPLER_H_
