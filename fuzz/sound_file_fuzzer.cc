// An untrusted sound file (WAV, AIFF, FLAC, Ogg, MP3, or whatever libsndfile
// takes it for) decoded from memory as the tool decodes files, then, if the
// tool would accept it, analysed. Decoding stops at a fixed number of
// samples: compressed formats can announce hours in a few bytes, and the
// bound keeps each run's memory and time small.
#include <sndfile.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "jni/apm/audio_analyzer.h"

namespace {

constexpr sf_count_t kMaxSamples = 1 << 17;

struct Memory {
  const uint8_t* data;
  sf_count_t size;
  sf_count_t position;
};

sf_count_t Length(void* user) { return static_cast<Memory*>(user)->size; }

sf_count_t Seek(sf_count_t offset, int whence, void* user) {
  auto* memory = static_cast<Memory*>(user);
  const sf_count_t base = whence == SEEK_CUR ? memory->position
                          : whence == SEEK_END ? memory->size
                                               : 0;
  const sf_count_t target = base + offset;
  if (target < 0 || target > memory->size) return -1;
  memory->position = target;
  return target;
}

sf_count_t Read(void* out, sf_count_t count, void* user) {
  auto* memory = static_cast<Memory*>(user);
  const sf_count_t n = std::min(count, memory->size - memory->position);
  if (n <= 0) return 0;
  std::memcpy(out, memory->data + memory->position, static_cast<size_t>(n));
  memory->position += n;
  return n;
}

sf_count_t Write(const void*, sf_count_t, void*) { return 0; }

sf_count_t Tell(void* user) { return static_cast<Memory*>(user)->position; }

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Memory memory{data, static_cast<sf_count_t>(size), 0};
  SF_VIRTUAL_IO io{Length, Seek, Read, Write, Tell};
  SF_INFO info{};
  SNDFILE* file = sf_open_virtual(&io, SFM_READ, &info, &memory);
  if (file == nullptr) return 0;
  // The tool's own refusals: no channels, no rate.
  if (info.channels < 1 || info.samplerate < 1 || info.channels > kMaxSamples) {
    sf_close(file);
    return 0;
  }
  const sf_count_t max_frames = kMaxSamples / info.channels;
  std::vector<int16_t> samples(static_cast<size_t>(max_frames * info.channels));
  sf_count_t frames = 0;
  while (frames < max_frames) {
    const sf_count_t got = sf_readf_short(
        file, samples.data() + frames * info.channels, std::min<sf_count_t>(4096, max_frames - frames));
    if (got <= 0) break;
    frames += got;
  }
  sf_close(file);
  // As the tool: a second at least, or nothing to analyse.
  if (frames < info.samplerate) return 0;

  samples.resize(static_cast<size_t>(frames * info.channels));
  apm::AudioAnalyzer analyzer(info.samplerate);
  const int32_t count = analyzer.CalculateBeats(
      reinterpret_cast<const uint8_t*>(samples.data()), static_cast<int32_t>(2 * samples.size()),
      info.channels, [](char) { return false; });
  if (count < -1) abort();
  for (int32_t i = 0; i < count; ++i) {
    const float t = analyzer.beats()[i];
    if (!std::isfinite(t) || t < 0 || (i > 0 && t <= analyzer.beats()[i - 1])) abort();
  }
  return 0;
}
