#include "tools/text_file.h"

#include <unistd.h>

#include <cerrno>

namespace cwtool {
namespace {

// Few system calls for documents of many small pieces, little memory.
constexpr size_t kBufferBytes = 1 << 16;

}  // namespace

bool TextFile::Create(const std::string& path, std::string* error) {
  buffer_.reserve(kBufferBytes);
  return file_.Create(path, error);
}

void TextFile::Write(std::string_view piece) {
  if (buffer_.size() + piece.size() > kBufferBytes) Flush();
  if (piece.size() >= kBufferBytes) {
    Put(piece);
  } else {
    buffer_ += piece;
  }
}

void TextFile::Flush() {
  Put(buffer_);
  buffer_.clear();
}

void TextFile::Put(std::string_view bytes) {
  for (size_t done = 0; errno_ == 0 && done < bytes.size();) {
    const ssize_t wrote = write(file_.fd(), bytes.data() + done, bytes.size() - done);
    if (wrote < 0 && errno == EINTR) continue;
    if (wrote <= 0) {
      errno_ = wrote < 0 ? errno : EIO;
      return;
    }
    done += static_cast<size_t>(wrote);
  }
}

bool TextFile::Commit(std::string* error) {
  Flush();
  if (errno_ != 0) {
    *error = WriteErrorText(errno_);
    return false;
  }
  return file_.Commit(error);
}

}  // namespace cwtool
