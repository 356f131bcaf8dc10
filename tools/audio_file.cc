#include "tools/audio_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdio>
#include <limits>
#include <mutex>

#include "tools/announced_length.h"

namespace cwtool {
namespace {

// libsndfile keeps the error of a failed open in a global; the lock keeps
// parallel opens from reading each other's.
std::mutex& OpenLock() {
  static std::mutex lock;
  return lock;
}

// 32-bit size fields, less room for the header chunks around the data.
constexpr int64_t kMax32BitDataBytes = 0xFFFFFFFFll - 4096;
// FLAC counts samples per channel in 36 bits.
constexpr int64_t kMaxFlacFrames = (int64_t{1} << 36) - 1;
constexpr int64_t kUnlimited = std::numeric_limits<int64_t>::max();

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
    case SF_ERR_SYSTEM:
      return "unreadable: input/output error";
    default:
      return "damaged or unsupported sound file (its header does not make sense)";
  }
}

std::string SystemErrorText(int errno_value) {
  switch (errno_value) {
    case ENOENT:
      return "no such file";
    case EACCES:
    case EPERM:
      return "unreadable: permission denied";
    case ENOTDIR:
      return "no such file (a part of the path is not a directory)";
    case ELOOP:
      return "unreadable: too many symbolic links";
    case ENAMETOOLONG:
      return "unreadable: name too long";
    default:
      return "unreadable: input/output error";
  }
}

const char* SpecialFileKind(mode_t mode) {
  if (S_ISFIFO(mode)) return "a named pipe";
  if (S_ISSOCK(mode)) return "a socket";
  if (S_ISCHR(mode)) return "a character device";
  if (S_ISBLK(mode)) return "a block device";
  return "not a regular file";
}

std::string Seconds(double seconds) {
  char text[32];
  snprintf(text, sizeof(text), "%.2f s", seconds);
  return text;
}

// The format and the most frames it holds, or 0 for an unknown extension.
int ContainerFor(const std::string& path, int32_t channels, int64_t frames,
                 int64_t* frame_limit) {
  const std::string ext = Extension(path);
  const int64_t bytes_per_frame = 2 * static_cast<int64_t>(std::max(channels, 1));
  const int64_t limit_32bit = kMax32BitDataBytes / bytes_per_frame;
  *frame_limit = kUnlimited;
  if (ext == "wav") {
    return frames < 0 || frames > limit_32bit ? SF_FORMAT_RF64 | SF_FORMAT_PCM_16
                                              : SF_FORMAT_WAV | SF_FORMAT_PCM_16;
  }
  if (ext == "ogg" || ext == "oga") return SF_FORMAT_OGG | SF_FORMAT_VORBIS;
  if (ext == "flac") {
    *frame_limit = kMaxFlacFrames;
    return SF_FORMAT_FLAC | SF_FORMAT_PCM_16;
  }
  *frame_limit = limit_32bit;
  if (ext == "aiff" || ext == "aif") return SF_FORMAT_AIFF | SF_FORMAT_PCM_16;
  if (ext == "au") return SF_FORMAT_AU | SF_FORMAT_PCM_16;
  return 0;
}

std::string TooLongText(const std::string& ext, int64_t frame_limit,
                        int32_t sample_rate) {
  return "too long for ." + ext + " (it holds at most " +
         Seconds(static_cast<double>(frame_limit) / sample_rate) +
         " at this rate and channel count); use .wav, .flac or .ogg";
}

}  // namespace

const char kUnknownOutputFormat[] =
    "unknown output format (use .wav, .flac, .ogg, .aiff or .au)";

AudioReader::~AudioReader() {
  if (file_ != nullptr) sf_close(file_);
  if (fd_ >= 0) close(fd_);
}

bool AudioReader::Open(const std::string& path, std::string* error) {
  // Non-blocking, so that a pipe without a writer cannot hold up the open;
  // anything but a regular file is refused right after it.
  fd_ = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY);
  if (fd_ < 0) {
    *error = SystemErrorText(errno);
    return false;
  }
  struct stat status;
  if (fstat(fd_, &status) != 0) {
    *error = SystemErrorText(errno);
    return false;
  }
  if (S_ISDIR(status.st_mode)) {
    *error = "is a directory, not a sound file";
    return false;
  }
  if (!S_ISREG(status.st_mode)) {
    *error = std::string("is ") + SpecialFileKind(status.st_mode) +
             ", not a regular file (sound files are read with seeks)";
    return false;
  }
  if (status.st_size == 0) {
    *error = "no audio (the file is empty)";
    return false;
  }
  fcntl(fd_, F_SETFL, fcntl(fd_, F_GETFL) & ~O_NONBLOCK);
  const int64_t announced = AnnouncedFrames(fd_);
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
  frames_ = info_.frames >= 0 && info_.frames < SF_COUNT_MAX ? info_.frames : -1;
  announced_frames_ = std::max(announced, frames_);
  file_size_ = status.st_size;
  return true;
}

int64_t AudioReader::Read(int16_t* frames, int64_t count) {
  const sf_count_t got = sf_readf_short(file_, frames, count);
  if (got <= 0) return 0;
  frames_read_ += got;
  return got;
}

double AudioReader::fraction_read() const {
  const off_t position = lseek(fd_, 0, SEEK_CUR);
  return position <= 0 ? 0.0 : std::min(1.0, static_cast<double>(position) / file_size_);
}

std::string AudioReader::ShortfallWarning() const {
  if (announced_frames_ <= frames_read_) return std::string();
  const double rate = info_.samplerate;
  return "truncated: " + Seconds(frames_read_ / rate) + " present of " +
         Seconds(announced_frames_ / rate) + " announced";
}

AudioWriter::~AudioWriter() {
  if (file_ != nullptr) sf_close(file_);
}

int OutputFormatFor(const std::string& path) {
  int64_t limit;
  return ContainerFor(path, 1, 0, &limit);
}

bool AudioWriter::Open(const std::string& path, int32_t sample_rate,
                       int32_t channels, int64_t frames, std::string* error) {
  SF_INFO info{};
  sample_rate_ = sample_rate;
  info.samplerate = sample_rate;
  info.channels = channels;
  extension_ = Extension(path);
  info.format = ContainerFor(path, channels, frames, &frame_limit_);
  if (info.format == 0) {
    *error = kUnknownOutputFormat;
    return false;
  }
  if (frames > frame_limit_) {
    *error = "cannot write: " + TooLongText(extension_, frame_limit_, sample_rate);
    return false;
  }
  if (!sf_format_check(&info)) {
    *error = "cannot store " + std::to_string(sample_rate) + " Hz, " +
             std::to_string(channels) + " channels as ." + extension_;
    return false;
  }
  if (!output_.Create(path, error)) return false;
  std::lock_guard<std::mutex> hold(OpenLock());
  file_ = sf_open_fd(output_.fd(), SFM_WRITE, &info, SF_FALSE);
  if (file_ == nullptr) {
    *error = "cannot write: the encoder refused the settings";
    return false;
  }
  // An unknown length may still end below 4 GiB: then a plain WAV.
  if (frames < 0 && (info.format & SF_FORMAT_TYPEMASK) == SF_FORMAT_RF64) {
    sf_command(file_, SFC_RF64_AUTO_DOWNGRADE, nullptr, SF_TRUE);
  }
  return true;
}

bool AudioWriter::Write(const int16_t* frames, int64_t count,
                        std::string* error) {
  if (count > frame_limit_ - frames_written_) {
    *error = "cannot write: " + TooLongText(extension_, frame_limit_, sample_rate_);
    return false;
  }
  errno = 0;
  if (sf_writef_short(file_, frames, count) != count) {
    *error = WriteErrorText(errno);
    return false;
  }
  frames_written_ += count;
  return true;
}

bool AudioWriter::Close(std::string* error) {
  errno = 0;
  const int code = sf_close(file_);
  file_ = nullptr;
  if (code != 0) {
    *error = WriteErrorText(errno);
    return false;
  }
  return output_.Commit(error);
}

}  // namespace cwtool
