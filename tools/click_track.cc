#include "tools/click_track.h"

#include <algorithm>
#include <cmath>
#include <cstdint>

#include "tools/audio_file.h"
#include "tools/interrupt.h"

namespace cwtool {
namespace {

// The music is lowered a little so that the clicks stand out without
// clipping on loud passages.
constexpr float kMusicGain = 0.6f;
constexpr float kClickLevel = 0.5f * 32767.0f;
constexpr double kClickHz = 2000.0;
constexpr double kClickSeconds = 0.02;
constexpr double kClickDecaySeconds = 0.004;
constexpr int64_t kBlockFrames = 8192;

std::vector<float> ClickShape(int32_t sample_rate) {
  std::vector<float> click(static_cast<size_t>(kClickSeconds * sample_rate) + 1);
  for (size_t i = 0; i < click.size(); ++i) {
    const double t = static_cast<double>(i) / sample_rate;
    click[i] = static_cast<float>(kClickLevel * std::sin(2 * M_PI * kClickHz * t) *
                                  std::exp(-t / kClickDecaySeconds));
  }
  return click;
}

}  // namespace

bool WriteClickTrack(const std::string& path, const std::string& input,
                     const std::vector<float>& beats, std::string* error) {
  AudioReader reader;
  if (!reader.Open(input, error)) return false;
  const int32_t sample_rate = reader.sample_rate();
  const int channels = reader.channels();
  AudioWriter writer;
  if (!writer.Open(path, sample_rate, channels, reader.frames(), error)) return false;
  const std::vector<float> click = ClickShape(sample_rate);
  const int64_t click_frames = static_cast<int64_t>(click.size());
  std::vector<int64_t> starts;
  for (const float beat : beats) {
    starts.push_back(std::llround(static_cast<double>(beat) * sample_rate));
  }

  std::vector<int16_t> music(static_cast<size_t>(kBlockFrames * channels));
  std::vector<float> mix;
  std::vector<int16_t> block;
  size_t first_beat = 0;
  for (int64_t begin = 0, got; (got = reader.Read(music.data(), kBlockFrames)) > 0;
       begin += got) {
    if (Interrupted()) return false;
    const int64_t end = begin + got;
    mix.assign(music.begin(), music.begin() + got * channels);
    for (float& sample : mix) sample *= kMusicGain;
    while (first_beat < starts.size() &&
           starts[first_beat] + click_frames <= begin) {
      ++first_beat;
    }
    for (size_t b = first_beat; b < starts.size() && starts[b] < end; ++b) {
      const int64_t from = std::max(begin, starts[b]);
      const int64_t to = std::min(end, starts[b] + click_frames);
      for (int64_t f = from; f < to; ++f) {
        for (int c = 0; c < channels; ++c) {
          mix[static_cast<size_t>((f - begin) * channels + c)] +=
              click[static_cast<size_t>(f - starts[b])];
        }
      }
    }
    block.resize(mix.size());
    for (size_t i = 0; i < mix.size(); ++i) {
      block[i] = static_cast<int16_t>(std::lround(std::clamp(mix[i], -32768.0f, 32767.0f)));
    }
    if (!writer.Write(block.data(), end - begin, error)) return false;
  }
  return writer.Close(error);
}

}  // namespace cwtool
