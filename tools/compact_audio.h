// The track re-encoded small enough to embed in a page: mono Ogg Vorbis at
// no more than 24 kHz, built in memory.
#ifndef CLIPWEAVER_TOOLS_COMPACT_AUDIO_H_
#define CLIPWEAVER_TOOLS_COMPACT_AUDIO_H_

#include <sndfile.h>

#include <cstdint>
#include <string>
#include <vector>

namespace cwtool {

class CompactAudioEncoder {
 public:
  static constexpr const char* kMime = "audio/ogg";

  CompactAudioEncoder() = default;
  ~CompactAudioEncoder();
  CompactAudioEncoder(const CompactAudioEncoder&) = delete;
  CompactAudioEncoder& operator=(const CompactAudioEncoder&) = delete;

  bool Open(int32_t sample_rate, int32_t channels, std::string* error);
  // Interleaved 16-bit frames at the rate and channel count given to Open.
  bool Add(const int16_t* frames, int64_t count, std::string* error);
  // The whole encoded file; the encoder is closed afterwards.
  bool Finish(std::string* bytes, std::string* error);

  // Growing in-memory file behind libsndfile's virtual I/O.
  struct Memory {
    std::string bytes;
    sf_count_t position = 0;
  };

 private:
  bool Flush(std::string* error);

  SNDFILE* file_ = nullptr;
  Memory memory_;
  int32_t channels_ = 0;
  int32_t decimation_ = 1;  // input frames averaged into one output frame
  // Sum of the input frames of the output frame being built.
  int64_t pending_sum_ = 0;
  int32_t pending_frames_ = 0;
  std::vector<int16_t> block_;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_COMPACT_AUDIO_H_
