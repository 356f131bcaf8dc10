// A steady 120 BPM pulse for the benchmarks: kicks every half second over
// low noise, interleaved 16-bit PCM at 44.1 kHz. Without kicks it is
// near-silence.
#ifndef CLIPWEAVER_BENCH_PULSE_TRACK_H_
#define CLIPWEAVER_BENCH_PULSE_TRACK_H_

#include <cmath>
#include <cstdint>
#include <vector>

constexpr int kPulseRate = 44100;

// Generates the track a block at a time, so that hours of it need not be
// held.
class PulseSource {
 public:
  PulseSource(int channels, bool kicks) : channels_(channels), kicks_(kicks) {}

  void Next(size_t frames, std::vector<int16_t>* pcm) {
    pcm->resize(frames * channels_);
    for (size_t i = 0; i < frames; ++i, ++frame_) {
      noise_ = noise_ * 1664525u + 1013904223u;
      const double since = std::fmod(static_cast<double>(frame_) / kPulseRate, 0.5);
      const double kick =
          kicks_ ? 16000 * std::exp(-since * 25) * std::sin(2 * M_PI * 70 * since) : 0;
      const int16_t v =
          static_cast<int16_t>(kick + static_cast<int>(noise_ >> 22) - 512);
      for (int c = 0; c < channels_; ++c) (*pcm)[i * channels_ + c] = v;
    }
  }

 private:
  int channels_;
  bool kicks_;
  size_t frame_ = 0;
  uint32_t noise_ = 12345;
};

inline std::vector<int16_t> PulseTrack(double seconds, int channels) {
  std::vector<int16_t> pcm;
  PulseSource(channels, true).Next(static_cast<size_t>(seconds * kPulseRate), &pcm);
  return pcm;
}

#endif  // CLIPWEAVER_BENCH_PULSE_TRACK_H_
