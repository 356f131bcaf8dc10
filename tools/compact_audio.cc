#include "tools/compact_audio.h"

#include <algorithm>
#include <cstring>

namespace cwtool {
namespace {

// Halving 44.1 or 48 kHz still keeps everything up to 11 kHz, hi-hats
// included, and roughly halves the size of the page.
constexpr int32_t kMaxRate = 24000;
// Vorbis quality from 0 (best) to 1 in libsndfile's terms: 30 to 60 kbit/s
// mono at 22 kHz, white noise being the worst case, so five minutes stay
// under 2.5 MB.
constexpr double kCompression = 0.6;
constexpr size_t kBlockFrames = 4096;

using Memory = CompactAudioEncoder::Memory;

sf_count_t Length(void* data) {
  return static_cast<sf_count_t>(static_cast<Memory*>(data)->bytes.size());
}

sf_count_t Seek(sf_count_t offset, int whence, void* data) {
  Memory* m = static_cast<Memory*>(data);
  const sf_count_t base = whence == SEEK_SET   ? 0
                          : whence == SEEK_CUR ? m->position
                                               : Length(data);
  if (base + offset < 0) return -1;
  m->position = base + offset;
  return m->position;
}

sf_count_t Read(void* out, sf_count_t count, void* data) {
  Memory* m = static_cast<Memory*>(data);
  const sf_count_t n = std::min(count, Length(data) - m->position);
  if (n <= 0) return 0;
  std::memcpy(out, m->bytes.data() + m->position, static_cast<size_t>(n));
  m->position += n;
  return n;
}

sf_count_t Write(const void* in, sf_count_t count, void* data) {
  Memory* m = static_cast<Memory*>(data);
  const size_t end = static_cast<size_t>(m->position + count);
  if (end > m->bytes.size()) m->bytes.resize(end);
  std::memcpy(&m->bytes[static_cast<size_t>(m->position)], in, static_cast<size_t>(count));
  m->position += count;
  return count;
}

sf_count_t Tell(void* data) { return static_cast<Memory*>(data)->position; }

SF_VIRTUAL_IO kMemoryIo = {Length, Seek, Read, Write, Tell};

}  // namespace

CompactAudioEncoder::~CompactAudioEncoder() {
  if (file_ != nullptr) sf_close(file_);
}

bool CompactAudioEncoder::Open(int32_t sample_rate, int32_t channels,
                               std::string* error) {
  channels_ = channels;
  decimation_ = std::max(1, (sample_rate + kMaxRate - 1) / kMaxRate);
  SF_INFO info{};
  info.samplerate = sample_rate / decimation_;
  info.channels = 1;
  info.format = SF_FORMAT_OGG | SF_FORMAT_VORBIS;
  file_ = sf_open_virtual(&kMemoryIo, SFM_WRITE, &info, &memory_);
  if (file_ == nullptr) {
    *error = std::string("cannot encode the audio: ") + sf_strerror(nullptr);
    return false;
  }
  double compression = kCompression;
  sf_command(file_, SFC_SET_COMPRESSION_LEVEL, &compression, sizeof(compression));
  return true;
}

bool CompactAudioEncoder::Add(const int16_t* frames, int64_t count,
                              std::string* error) {
  for (int64_t f = 0; f < count; ++f) {
    for (int c = 0; c < channels_; ++c) pending_sum_ += frames[f * channels_ + c];
    if (++pending_frames_ < decimation_) continue;
    // A plain average: a crude low-pass, but the aliasing is far below
    // what a listener checking beats would notice.
    block_.push_back(static_cast<int16_t>(pending_sum_ / (channels_ * decimation_)));
    pending_sum_ = 0;
    pending_frames_ = 0;
    if (block_.size() == kBlockFrames && !Flush(error)) return false;
  }
  return true;
}

bool CompactAudioEncoder::Flush(std::string* error) {
  const sf_count_t n = static_cast<sf_count_t>(block_.size());
  if (sf_write_short(file_, block_.data(), n) != n) {
    *error = std::string("cannot encode the audio: ") + sf_strerror(file_);
    return false;
  }
  block_.clear();
  return true;
}

bool CompactAudioEncoder::Finish(std::string* bytes, std::string* error) {
  if (!Flush(error)) return false;
  sf_close(file_);
  file_ = nullptr;
  *bytes = std::move(memory_.bytes);
  return true;
}

}  // namespace cwtool
