#include "tools/audio_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstring>
#include <limits>
#include <mutex>

namespace cwtool {
namespace {

// libsndfile keeps the error of a failed open in a global; the lock keeps
// parallel opens from reading each other's.
std::mutex& OpenLock() {
  static std::mutex lock;
  return lock;
}

std::string Lowercased(std::string text) {
  if (!text.empty()) {
    text[0] = static_cast<char>(std::tolower(static_cast<unsigned char>(text[0])));
  }
  return text;
}

std::string Extension(const std::string& path) {
  const size_t slash = path.find_last_of('/');
  const size_t dot = path.find_last_of('.');
  if (dot == std::string::npos || (slash != std::string::npos && dot < slash)) {
    return "";
  }
  std::string ext = path.substr(dot + 1);
  for (char& c : ext) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return ext;
}

std::string OpenErrorText(int code) {
  switch (code) {
    case SF_ERR_UNRECOGNISED_FORMAT:
      return "unsupported format (not a sound file libsndfile can decode)";
    case SF_ERR_UNSUPPORTED_ENCODING:
      return "unsupported format (unknown encoding)";
    default:
      return "unreadable: " + Lowercased(sf_error_number(code));
  }
}

}  // namespace

AudioReader::~AudioReader() {
  if (file_ != nullptr) sf_close(file_);
  if (fd_ >= 0) close(fd_);
}

bool AudioReader::Open(const std::string& path, std::string* error) {
  struct stat status;
  if (stat(path.c_str(), &status) != 0) {
    *error = errno == ENOENT ? "no such file"
                             : "unreadable: " + Lowercased(std::strerror(errno));
    return false;
  }
  if (S_ISDIR(status.st_mode)) {
    *error = "is a directory, not a sound file";
    return false;
  }
  if (S_ISREG(status.st_mode) && status.st_size == 0) {
    *error = "no audio (the file is empty)";
    return false;
  }
  // Opening the path ourselves tells "permission denied" apart from the
  // format errors that libsndfile reports.
  fd_ = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd_ < 0) {
    *error = "unreadable: " + Lowercased(std::strerror(errno));
    return false;
  }
  {
    std::lock_guard<std::mutex> hold(OpenLock());
    info_ = SF_INFO{};
    file_ = sf_open_fd(fd_, SFM_READ, &info_, SF_FALSE);
    if (file_ == nullptr) *error = OpenErrorText(sf_error(nullptr));
  }
  if (file_ == nullptr) return false;
  if (info_.channels < 1 || info_.samplerate < 1) {
    *error = "unsupported format (no channels or no sample rate)";
    return false;
  }
  return true;
}

int64_t AudioReader::Read(int16_t* frames, int64_t count) {
  const sf_count_t got = sf_readf_short(file_, frames, count);
  return got > 0 ? got : 0;
}

AudioWriter::~AudioWriter() {
  if (file_ != nullptr) sf_close(file_);
}

int OutputFormatFor(const std::string& path) {
  const std::string ext = Extension(path);
  if (ext == "wav") return SF_FORMAT_WAV | SF_FORMAT_PCM_16;
  if (ext == "flac") return SF_FORMAT_FLAC | SF_FORMAT_PCM_16;
  if (ext == "ogg" || ext == "oga") return SF_FORMAT_OGG | SF_FORMAT_VORBIS;
  if (ext == "aiff" || ext == "aif") return SF_FORMAT_AIFF | SF_FORMAT_PCM_16;
  if (ext == "au") return SF_FORMAT_AU | SF_FORMAT_PCM_16;
  return 0;
}

bool AudioWriter::Open(const std::string& path, int32_t sample_rate,
                       int32_t channels, std::string* error) {
  SF_INFO info{};
  info.samplerate = sample_rate;
  info.channels = channels;
  info.format = OutputFormatFor(path);
  if (info.format == 0) {
    *error = "unknown output format (use .wav, .flac, .ogg, .aiff or .au)";
    return false;
  }
  if (!sf_format_check(&info)) {
    *error = "cannot store " + std::to_string(sample_rate) + " Hz, " +
             std::to_string(channels) + " channels as ." + Extension(path);
    return false;
  }
  std::lock_guard<std::mutex> hold(OpenLock());
  file_ = sf_open(path.c_str(), SFM_WRITE, &info);
  if (file_ == nullptr) {
    *error = "cannot write: " + Lowercased(sf_strerror(nullptr));
    return false;
  }
  return true;
}

bool AudioWriter::Write(const int16_t* frames, int64_t count,
                        std::string* error) {
  if (sf_writef_short(file_, frames, count) != count) {
    *error = "cannot write: " + Lowercased(sf_strerror(file_));
    return false;
  }
  return true;
}

bool AudioWriter::Close(std::string* error) {
  const int code = sf_close(file_);
  file_ = nullptr;
  if (code != 0) {
    *error = "cannot write: " + Lowercased(sf_error_number(code));
    return false;
  }
  return true;
}

bool DecodeFile(const std::string& path, const std::atomic<bool>& stop,
                DecodedAudio* audio, std::string* error) {
  AudioReader reader;
  if (!reader.Open(path, error)) return false;
  audio->sample_rate = reader.sample_rate();
  audio->channels = reader.channels();
  audio->samples.clear();
  constexpr int64_t kChunkFrames = 1 << 16;
  const size_t chunk = static_cast<size_t>(kChunkFrames * audio->channels);
  if (reader.frames() > 0 && reader.frames() < (int64_t{1} << 28)) {
    audio->samples.reserve(static_cast<size_t>(reader.frames() * audio->channels));
  }
  size_t used = 0;
  for (;;) {
    if (stop.load()) {
      *error = "interrupted";
      return false;
    }
    audio->samples.resize(used + chunk);
    const int64_t got = reader.Read(audio->samples.data() + used, kChunkFrames);
    used += static_cast<size_t>(got * audio->channels);
    if (got < kChunkFrames) break;
  }
  audio->samples.resize(used);
  audio->samples.shrink_to_fit();
  if (used == 0) {
    *error = "no audio (the file holds no samples)";
    return false;
  }
  return true;
}

}  // namespace cwtool
