// A steady 120 BPM pulse for the benchmarks: kicks every half second over
// low noise, interleaved 16-bit PCM at 44.1 kHz.
#ifndef CLIPWEAVER_BENCH_PULSE_TRACK_H_
#define CLIPWEAVER_BENCH_PULSE_TRACK_H_

#include <cmath>
#include <cstdint>
#include <vector>

constexpr int kPulseRate = 44100;

inline std::vector<int16_t> PulseTrack(double seconds, int channels) {
  const size_t frames = static_cast<size_t>(seconds * kPulseRate);
  std::vector<int16_t> pcm(frames * channels);
  uint32_t noise = 12345;
  for (size_t i = 0; i < frames; ++i) {
    noise = noise * 1664525u + 1013904223u;
    const double since = std::fmod(static_cast<double>(i) / kPulseRate, 0.5);
    const double kick =
        16000 * std::exp(-since * 25) * std::sin(2 * M_PI * 70 * since);
    const int16_t v =
        static_cast<int16_t>(kick + static_cast<int>(noise >> 22) - 512);
    for (int c = 0; c < channels; ++c) pcm[i * channels + c] = v;
  }
  return pcm;
}

#endif  // CLIPWEAVER_BENCH_PULSE_TRACK_H_
