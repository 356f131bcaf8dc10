// The beat analysis on hostile input: rate, channel count, size, PCM and a
// cancellation byte all come from the fuzzer. Any result must be -1 or a
// count of finite, ascending, non-negative beat times.
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "jni/apm/audio_analyzer.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size < 7) return 0;
  int32_t sample_rate;
  std::memcpy(&sample_rate, data, 4);
  const int32_t channel_count = static_cast<int8_t>(data[4]);
  const int cancel_at = data[5];
  const int32_t size_in_bytes = static_cast<int32_t>(size - 6);
  // A copy of exactly the claimed bytes, so that a read past them is caught.
  uint8_t* pcm = static_cast<uint8_t*>(malloc(size_in_bytes));
  std::memcpy(pcm, data + 6, size_in_bytes);

  apm::AudioAnalyzer analyzer(sample_rate);
  int previous = -1;
  const int32_t count = analyzer.CalculateBeats(
      pcm, size_in_bytes, channel_count, [&](char byte) {
        const int progress = static_cast<unsigned char>(byte);
        if (progress < previous || progress > 98) abort();
        previous = progress;
        return progress >= cancel_at;
      });
  if (count < -1) abort();
  for (int32_t i = 0; i < count; ++i) {
    const float t = analyzer.beats()[i];
    if (!std::isfinite(t) || t < 0 || (i > 0 && t <= analyzer.beats()[i - 1])) {
      abort();
    }
  }
  free(pcm);
  return 0;
}
