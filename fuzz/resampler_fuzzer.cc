// The resampler with a fuzzed format and a fuzzed sequence of calls. Every
// buffer is allocated to exactly the size the caller is told to provide, so
// AddressSanitizer catches any read or write past it.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "fuzz/fuzz_reader.h"
#include "resampler/audio_resampler.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzReader in(data, size);
  const int bit_depth = in.Next(1) % 2 == 0 ? 16 : 8;
  const int channels = static_cast<int>(in.Next(1) % 4);
  const int32_t rate = static_cast<int32_t>(in.Next(4));
  const bool stereo_output = in.Next(1) % 2;
  std::unique_ptr<norvane::AudioResampler> resampler(norvane::AudioResampler::create(
      bit_depth, channels, rate, norvane::AudioResampler::QUALITY_LOW, stereo_output));
  resampler->setSourceSampleRate(rate);
  resampler->setVolume(1.0f, 1.0f);
  for (int step = 0; step < 64 && !in.empty(); ++step) {
    switch (in.Next(1) % 4) {
      case 0: {
        float left, right;
        const uint32_t l = in.Next(4), r = in.Next(4);
        std::memcpy(&left, &l, 4);
        std::memcpy(&right, &r, 4);
        resampler->setVolume(left, right);
        break;
      }
      case 1:
        resampler->setSourceSampleRate(static_cast<int32_t>(in.Next(4)));
        break;
      case 2:
        resampler->reset();
        break;
      default: {
        const size_t frames = in.Next(2) % 4096;
        const size_t input_samples = frames * (channels > 0 ? channels : 1);
        const uint64_t output_samples = resampler->getOutputSampleCount(frames);
        // Extreme upsampling asks for more room than is worth giving.
        if (output_samples > (1u << 24)) break;
        auto* input = static_cast<int16_t*>(malloc(input_samples * 2 + 1));
        auto* output = static_cast<int16_t*>(malloc(output_samples * 2 + 1));
        for (size_t i = 0; i < input_samples; ++i) input[i] = static_cast<int16_t>(in.Next(2));
        memset(output, 0, output_samples * 2);
        resampler->resample(output, input, frames);
        free(input);
        free(output);
      }
    }
  }
  return 0;
}
