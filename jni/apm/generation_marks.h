// A set of marks that one step forgets whole: each mark holds the generation
// it was made in, so a new generation clears them all without a pass.
#ifndef CLIPWEAVER_JNI_APM_GENERATION_MARKS_H_
#define CLIPWEAVER_JNI_APM_GENERATION_MARKS_H_

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace apm {

class GenerationMarks {
 public:
  void Reset(size_t size) {
    marks_.assign(size, 0);
    generation_ = 0;
  }

  // Grows the set to `size` indices, keeping its marks.
  void Grow(size_t size) {
    if (marks_.size() < size) marks_.resize(size, 0);
  }

  // Generation 0 stands for "never marked", so a wrap clears for real.
  void NextGeneration() {
    if (++generation_ == 0) {
      std::fill(marks_.begin(), marks_.end(), 0);
      generation_ = 1;
    }
  }

  // Whether index was marked in this generation (after NextGeneration).
  bool Marked(size_t index) const { return marks_[index] == generation_; }

  // True when index was not yet marked in this generation; marks it.
  bool Mark(size_t index) { return Marker{marks_.data(), generation_}.Mark(index); }

  // The same for a loop of marks with nothing else changing the set: the
  // generation stays in a register rather than being read again after
  // every mark, which might have changed it.
  struct Marker {
    uint32_t* marks;
    uint32_t generation;
    bool Mark(size_t index) const {
      const bool first = marks[index] != generation;
      marks[index] = generation;
      return first;
    }
  };
  Marker Hold() { return {marks_.data(), generation_}; }

 private:
  std::vector<uint32_t> marks_;
  uint32_t generation_ = 0;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_GENERATION_MARKS_H_
