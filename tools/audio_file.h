// Sound files through libsndfile, always as interleaved 16-bit PCM.
#ifndef CLIPWEAVER_TOOLS_AUDIO_FILE_H_
#define CLIPWEAVER_TOOLS_AUDIO_FILE_H_

#include <sndfile.h>

#include <cstdint>
#include <string>

#include "tools/output_file.h"

namespace cwtool {

class AudioReader {
 public:
  AudioReader() = default;
  ~AudioReader();
  AudioReader(const AudioReader&) = delete;
  AudioReader& operator=(const AudioReader&) = delete;

  // Only regular files: pipes and devices are refused without waiting on
  // them. On failure *error says why in a few words ("no such file", ...).
  bool Open(const std::string& path, std::string* error);
  int32_t sample_rate() const { return info_.samplerate; }
  int32_t channels() const { return info_.channels; }
  // What the decoder expects to deliver; -1 when unknown.
  int64_t frames() const { return frames_; }
  // 0..1, by the bytes consumed so far, for when frames() is unknown.
  double fraction_read() const;
  // Frames read into `frames` (room for count * channels() samples); 0 at
  // the end or on a decoding error.
  int64_t Read(int16_t* frames, int64_t count);
  // After the last Read: a warning when fewer frames came than announced,
  // else empty.
  std::string ShortfallWarning() const;

 private:
  int fd_ = -1;
  SNDFILE* file_ = nullptr;
  SF_INFO info_{};
  int64_t frames_ = -1;
  int64_t announced_frames_ = -1;
  int64_t frames_read_ = 0;
  int64_t file_size_ = 0;
};

class AudioWriter {
 public:
  AudioWriter() = default;
  ~AudioWriter();
  AudioWriter(const AudioWriter&) = delete;
  AudioWriter& operator=(const AudioWriter&) = delete;

  // The container follows the extension: .wav, .flac, .ogg (Vorbis),
  // .aiff/.aif or .au; 16-bit wherever the container has a bit depth.
  // frames is the length about to be written (-1: unknown); a length the
  // container cannot hold is refused here, before anything is written.
  // Nothing appears under path before Close().
  bool Open(const std::string& path, int32_t sample_rate, int32_t channels,
            int64_t frames, std::string* error);
  bool Write(const int16_t* frames, int64_t count, std::string* error);
  // Finishes the file and puts it in place; false when the last writes or
  // the header failed.
  bool Close(std::string* error);

 private:
  OutputFile output_;
  SNDFILE* file_ = nullptr;
  int32_t sample_rate_ = 0;
  int64_t frame_limit_ = 0;
  int64_t frames_written_ = 0;
  std::string extension_;
};

// The libsndfile container for an output file name, or 0 for an extension
// it does not know. The length decides between WAV and RF64 later.
int OutputFormatFor(const std::string& path);

// "unknown output format (use ...)" for the error lines.
extern const char kUnknownOutputFormat[];

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_AUDIO_FILE_H_
