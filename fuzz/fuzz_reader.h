// The fuzzer's bytes read as a sequence of big-endian numbers; past the end
// they read as zeros, so that every input drives a whole run.
#ifndef CLIPWEAVER_FUZZ_FUZZ_READER_H_
#define CLIPWEAVER_FUZZ_FUZZ_READER_H_

#include <cstddef>
#include <cstdint>

class FuzzReader {
 public:
  FuzzReader(const uint8_t* data, size_t size) : data_(data), size_(size) {}
  bool empty() const { return position_ >= size_; }
  uint32_t Next(int bytes) {
    uint32_t value = 0;
    for (int i = 0; i < bytes; ++i) {
      value = (value << 8) | (position_ < size_ ? data_[position_] : 0);
      ++position_;
    }
    return value;
  }

 private:
  const uint8_t* data_;
  size_t size_;
  size_t position_ = 0;
};

#endif  // CLIPWEAVER_FUZZ_FUZZ_READER_H_
