#include "tools/example_groove.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "tools/audio_file.h"
#include "tools/interrupt.h"

namespace cwtool {
namespace {

constexpr double kMasterGain = 0.55;
constexpr double kNoiseFloor = 0.002;
// The longest voice rings for well under three beats at the fastest tempo
// allowed, so each sample sums the hits of the last three beats only.
constexpr int kHitsHeard = 3;

enum Voice : uint64_t { kSnareNoise = 1, kHatNoise = 2, kFloorNoise = 3 };

uint64_t Mix64(uint64_t x) {
  x += 0x9E3779B97F4A7C15ull;
  x = (x ^ (x >> 30)) * 0xBF58476D1CE4E5B9ull;
  x = (x ^ (x >> 27)) * 0x94D049BB133111EBull;
  return x ^ (x >> 31);
}

// Uniform in [-1, 1), a function of the voice, the hit and the sample.
double Noise(Voice voice, int64_t hit, int64_t sample) {
  const uint64_t h = Mix64(Mix64(voice * 0x100000001B3ull ^ static_cast<uint64_t>(hit)) ^
                           static_cast<uint64_t>(sample));
  return static_cast<double>(h >> 11) * (2.0 / 9007199254740992.0) - 1.0;
}

// A sine falling from 155 Hz to 45 Hz within a few tens of milliseconds.
double Kick(double tau) {
  if (tau >= 0.4) return 0;
  constexpr double kLow = 45, kSweep = 110, kSweepTime = 0.025;
  const double phase =
      kLow * tau + kSweep * kSweepTime * (1 - std::exp(-tau / kSweepTime));
  return 0.9 * std::exp(-tau / 0.12) * std::sin(2 * M_PI * phase);
}

double Snare(double tau, int64_t hit, int64_t sample) {
  if (tau >= 0.3) return 0;
  return 0.45 * std::exp(-tau / 0.05) * Noise(kSnareNoise, hit, sample) +
         0.25 * std::exp(-tau / 0.04) * std::sin(2 * M_PI * 185 * tau);
}

// First difference of white noise: mostly high frequencies.
double Hat(double tau, int64_t hit, int64_t sample) {
  if (tau < 0 || tau >= 0.1) return 0;
  const double hiss = Noise(kHatNoise, hit, sample) - Noise(kHatNoise, hit, sample - 1);
  return 0.15 * std::exp(-tau / 0.012) * hiss;
}

int16_t ToPcm(double value) {
  return static_cast<int16_t>(std::lround(std::clamp(value * 32767.0, -32768.0, 32767.0)));
}

}  // namespace

int64_t GrooveFrames(const GrooveSettings& settings) {
  return std::llround(settings.seconds * settings.sample_rate);
}

void RenderGroove(const GrooveSettings& settings, int64_t first, int32_t count,
                  int16_t* out) {
  const double rate = settings.sample_rate;
  const double period = 60.0 / settings.bpm;
  for (int64_t frame = first; frame < first + count; ++frame) {
    const double t = frame / rate;
    const int64_t beat = static_cast<int64_t>(std::floor(t / period));
    double drums = 0, hats = 0;
    for (int64_t hit = std::max<int64_t>(0, beat - kHitsHeard + 1); hit <= beat; ++hit) {
      const double tau = t - hit * period;
      // Sample number within the hit, so that every hit has its own noise.
      const int64_t sample = frame - static_cast<int64_t>(std::ceil(hit * period * rate));
      drums += Kick(tau);
      if (hit % 2 == 1) drums += Snare(tau, hit, sample);
      hats += Hat(tau - period / 2, hit, sample);
    }
    const double floor_noise = kNoiseFloor * Noise(kFloorNoise, 0, frame);
    const double left = kMasterGain * (drums + 0.7 * hats + floor_noise);
    if (settings.channels == 1) {
      *out++ = ToPcm(kMasterGain * (drums + 0.85 * hats + floor_noise));
    } else {
      *out++ = ToPcm(left);
      *out++ = ToPcm(kMasterGain * (drums + hats - floor_noise));
    }
  }
}

bool WriteGroove(const std::string& path, const GrooveSettings& settings,
                 std::string* error) {
  const int64_t frames = GrooveFrames(settings);
  AudioWriter writer;
  if (!writer.Open(path, settings.sample_rate, settings.channels, frames, error)) {
    return false;
  }
  constexpr int32_t kBlockFrames = 4096;
  std::vector<int16_t> block(static_cast<size_t>(kBlockFrames * settings.channels));
  for (int64_t first = 0; first < frames; first += kBlockFrames) {
    if (Interrupted()) return false;
    const int32_t count = static_cast<int32_t>(std::min<int64_t>(kBlockFrames, frames - first));
    RenderGroove(settings, first, count, block.data());
    if (!writer.Write(block.data(), count, error)) return false;
  }
  return writer.Close(error);
}

}  // namespace cwtool
