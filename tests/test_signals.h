// Test signals made with integer arithmetic only, so they are the same on
// every target: noise, tones, decays and click tracks of 16-bit PCM; and the
// digest that golden outputs are kept as.
#ifndef CLIPWEAVER_TESTS_TEST_SIGNALS_H_
#define CLIPWEAVER_TESTS_TEST_SIGNALS_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace test_signals {

// Numerical Recipes' LCG; the high half is the noise sample.
class Noise {
 public:
  explicit Noise(uint32_t seed) : state_(seed) {}
  int32_t Next() {
    state_ = state_ * 1664525u + 1013904223u;
    return static_cast<int32_t>(state_ >> 16) - 32768;
  }

 private:
  uint32_t state_;
};

// Triangle wave from a 32-bit phase accumulator, in -32768..32767.
inline int32_t Triangle(uint32_t phase) {
  const int32_t ramp = static_cast<int32_t>(phase >> 15);  // 0..131071
  return (ramp < 65536 ? ramp : 131071 - ramp) - 32768;
}

inline uint32_t PhaseStep(int32_t hertz, int32_t sample_rate) {
  return static_cast<uint32_t>((static_cast<uint64_t>(hertz) << 32) /
                               static_cast<uint64_t>(sample_rate));
}

// (remaining / length)^2 in 1/65536ths: a percussive decay.
inline int64_t Decay(int64_t since, int64_t length) {
  if (since < 0 || since >= length) return 0;
  const int64_t remaining = length - since;
  return remaining * remaining * 65536 / (length * length);
}

inline int16_t Clamp16(int64_t v) {
  return static_cast<int16_t>(v < -32768 ? -32768 : v > 32767 ? 32767 : v);
}

// `channels` equal channels of clicks (a 300 Hz burst of 20 ms) every
// `period` seconds over noise of about -50 dB.
inline std::vector<int16_t> Clicks(int32_t rate, int32_t channels,
                                   double seconds, double period) {
  const auto frames = static_cast<int64_t>(seconds * rate);
  const auto period_frames = static_cast<int64_t>(period * rate);
  const int64_t burst = rate / 50;
  const uint32_t step = PhaseStep(300, rate);
  Noise noise(1);
  std::vector<int16_t> pcm(static_cast<size_t>(frames * channels));
  for (int64_t i = 0; i < frames; ++i) {
    const int64_t since = i % period_frames;
    const int64_t click = Triangle(static_cast<uint32_t>(since) * step) *
                          Decay(since, burst) / 65536 * 2 / 3;
    const int16_t v = Clamp16(noise.Next() / 32 + click);
    for (int32_t c = 0; c < channels; ++c) pcm[i * channels + c] = v;
  }
  return pcm;
}

// FNV-1a over bytes, continuing from `hash`.
inline uint64_t Fnv1a(const void* data, size_t size, uint64_t hash = 0xcbf29ce484222325u) {
  const auto* bytes = static_cast<const unsigned char*>(data);
  for (size_t i = 0; i < size; ++i) hash = (hash ^ bytes[i]) * 0x100000001b3u;
  return hash;
}

}  // namespace test_signals

#endif  // CLIPWEAVER_TESTS_TEST_SIGNALS_H_
