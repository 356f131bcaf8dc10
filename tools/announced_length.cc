#include "tools/announced_length.h"

#include <unistd.h>

#include <cstring>

namespace cwtool {
namespace {

// Headers put their sizes near the start; metadata chunks before the
// audio are seldom larger than this.
constexpr off_t kScanLimit = 1 << 20;

uint32_t Little32(const unsigned char* p) {
  return p[0] | p[1] << 8 | p[2] << 16 | static_cast<uint32_t>(p[3]) << 24;
}
uint32_t Big32(const unsigned char* p) {
  return static_cast<uint32_t>(p[0]) << 24 | p[1] << 16 | p[2] << 8 | p[3];
}

bool ReadAt(int fd, off_t at, unsigned char* out, size_t size) {
  return pread(fd, out, size, at) == static_cast<ssize_t>(size);
}

int64_t WavFrames(int fd) {
  uint32_t block_align = 0;
  unsigned char chunk[8];
  for (off_t at = 12; at < kScanLimit && ReadAt(fd, at, chunk, 8);) {
    const uint32_t size = Little32(chunk + 4);
    if (std::memcmp(chunk, "fmt ", 4) == 0) {
      unsigned char align[2];
      if (!ReadAt(fd, at + 8 + 12, align, 2)) return -1;
      block_align = align[0] | align[1] << 8;
    } else if (std::memcmp(chunk, "data", 4) == 0) {
      // Streaming writers leave 0 or all ones there.
      if (block_align == 0 || size == 0 || size == 0xFFFFFFFFu) return -1;
      return size / block_align;
    }
    at += 8 + static_cast<off_t>(size) + (size & 1);
  }
  return -1;
}

int64_t AiffFrames(int fd) {
  unsigned char chunk[8];
  for (off_t at = 12; at < kScanLimit && ReadAt(fd, at, chunk, 8);) {
    const uint32_t size = Big32(chunk + 4);
    if (std::memcmp(chunk, "COMM", 4) == 0) {
      unsigned char frames[4];
      if (!ReadAt(fd, at + 8 + 2, frames, 4)) return -1;
      return Big32(frames);
    }
    at += 8 + static_cast<off_t>(size) + (size & 1);
  }
  return -1;
}

}  // namespace

int64_t AnnouncedFrames(int fd) {
  unsigned char head[12];
  if (!ReadAt(fd, 0, head, sizeof(head))) return -1;
  if (std::memcmp(head, "RIFF", 4) == 0 && std::memcmp(head + 8, "WAVE", 4) == 0) {
    return WavFrames(fd);
  }
  if (std::memcmp(head, "FORM", 4) == 0 &&
      (std::memcmp(head + 8, "AIFF", 4) == 0 || std::memcmp(head + 8, "AIFC", 4) == 0)) {
    return AiffFrames(fd);
  }
  return -1;
}

}  // namespace cwtool
