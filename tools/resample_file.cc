#include "tools/resample_file.h"

#include <algorithm>
#include <memory>
#include <numeric>
#include <vector>

#include "resampler/audio_resampler.h"
#include "tools/audio_file.h"
#include "tools/interrupt.h"

namespace cwtool {
namespace {

constexpr int64_t kTargetBlockFrames = 4096;

// The resampler starts every call at the start of its block and makes
// floor(out * n / in) frames of it, dropping the rest of the fraction. Whole
// multiples of in / gcd(in, out) frames convert without remainder, so only
// the final block can lose a fraction of a frame. The block is sized by the
// larger side, so one block's output stays within one unit of out / gcd
// frames (3 MB of stereo at most) whatever the ratio.
int64_t InputBlockFrames(int32_t in_rate, int32_t out_rate) {
  const int64_t divisor = std::gcd(in_rate, out_rate);
  const int64_t in_unit = in_rate / divisor;
  const int64_t out_unit = out_rate / divisor;
  return in_unit * std::max<int64_t>(1, kTargetBlockFrames / std::max(in_unit, out_unit));
}

}  // namespace

bool ResampleFile(const ResampleSettings& settings, int64_t* frames_written,
                  std::string* warning, std::string* error) {
  AudioReader reader;
  if (!reader.Open(settings.input, error)) {
    *error = settings.input + ": " + *error;
    return false;
  }
  const int32_t channels = reader.channels();
  const int32_t in_rate = reader.sample_rate();
  if (channels != 1 && channels != 2) {
    *error = settings.input + ": " + std::to_string(channels) +
             " channels (the resampler takes mono or stereo)";
    return false;
  }
  if (!norvane::AudioResampler::ratesSupported(in_rate, settings.rate)) {
    *error = settings.input + ": " + std::to_string(in_rate) + " Hz to " +
             std::to_string(settings.rate) +
             " Hz is more than the 3:1 reduction the resampler allows";
    return false;
  }
  const int64_t expected =
      reader.frames() < 0 ? -1
                          : static_cast<int64_t>(norvane::AudioResampler::outputFrameCount(
                                in_rate, settings.rate, static_cast<uint64_t>(reader.frames())));
  AudioWriter writer;
  if (!writer.Open(settings.output, settings.rate, channels, expected, error)) {
    *error = settings.output + ": " + *error;
    return false;
  }

  std::unique_ptr<norvane::AudioResampler> resampler(
      norvane::AudioResampler::create(16, channels, settings.rate,
                                      norvane::AudioResampler::QUALITY_LOW,
                                      false));
  resampler->setSourceSampleRate(in_rate);
  resampler->setVolume(settings.left_gain, settings.right_gain);

  const int64_t in_block = InputBlockFrames(in_rate, settings.rate);
  std::vector<int16_t> input(static_cast<size_t>(in_block * channels));
  std::vector<int16_t> output(static_cast<size_t>(
      norvane::AudioResampler::outputFrameCount(in_rate, settings.rate, in_block) *
      channels));
  *frames_written = 0;
  for (;;) {
    if (Interrupted()) return false;
    const int64_t got = reader.Read(input.data(), in_block);
    if (got == 0) break;
    const int64_t made = static_cast<int64_t>(
        norvane::AudioResampler::outputFrameCount(in_rate, settings.rate, got));
    std::fill_n(output.begin(), made * channels, int16_t{0});
    resampler->resample(output.data(), input.data(), static_cast<size_t>(got));
    if (!writer.Write(output.data(), made, error)) {
      *error = settings.output + ": " + *error;
      return false;
    }
    *frames_written += made;
  }
  *warning = reader.ShortfallWarning();
  if (!writer.Close(error)) {
    *error = settings.output + ": " + *error;
    return false;
  }
  return true;
}

}  // namespace cwtool
