// Sound files through libsndfile, always as interleaved 16-bit PCM.
#ifndef CLIPWEAVER_TOOLS_AUDIO_FILE_H_
#define CLIPWEAVER_TOOLS_AUDIO_FILE_H_

#include <sndfile.h>

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

namespace cwtool {

// A whole file in memory.
struct DecodedAudio {
  int32_t sample_rate = 0;
  int32_t channels = 0;
  std::vector<int16_t> samples;  // interleaved

  int64_t frames() const {
    return channels > 0 ? static_cast<int64_t>(samples.size()) / channels : 0;
  }
  double seconds() const {
    return sample_rate > 0 ? static_cast<double>(frames()) / sample_rate : 0.0;
  }
};

class AudioReader {
 public:
  AudioReader() = default;
  ~AudioReader();
  AudioReader(const AudioReader&) = delete;
  AudioReader& operator=(const AudioReader&) = delete;

  // On failure *error says why in a few words ("no such file", ...).
  bool Open(const std::string& path, std::string* error);
  int32_t sample_rate() const { return info_.samplerate; }
  int32_t channels() const { return info_.channels; }
  // As the header claims; a hint only.
  int64_t frames() const { return info_.frames; }
  // Frames read into `frames` (room for count * channels() samples); 0 at
  // the end or on a decoding error.
  int64_t Read(int16_t* frames, int64_t count);

 private:
  int fd_ = -1;
  SNDFILE* file_ = nullptr;
  SF_INFO info_{};
};

class AudioWriter {
 public:
  AudioWriter() = default;
  ~AudioWriter();
  AudioWriter(const AudioWriter&) = delete;
  AudioWriter& operator=(const AudioWriter&) = delete;

  // The container follows the extension: .wav, .flac, .ogg (Vorbis),
  // .aiff/.aif or .au; 16-bit wherever the container has a bit depth.
  bool Open(const std::string& path, int32_t sample_rate, int32_t channels,
            std::string* error);
  bool Write(const int16_t* frames, int64_t count, std::string* error);
  // Finishes the file; false when the last writes or the header failed.
  bool Close(std::string* error);

 private:
  SNDFILE* file_ = nullptr;
};

// Reads all of path. Gives up with the error "interrupted" as soon as
// *stop is set.
bool DecodeFile(const std::string& path, const std::atomic<bool>& stop,
                DecodedAudio* audio, std::string* error);

// The libsndfile format for an output file name, or 0 for an extension it
// does not know.
int OutputFormatFor(const std::string& path);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_AUDIO_FILE_H_
