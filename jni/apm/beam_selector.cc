#include "jni/apm/beam_selector.h"

#include <algorithm>

namespace apm {
namespace {

bool Larger(const BeamEntry& a, const BeamEntry& b) {
  return a.value > b.value;
}

}  // namespace

void BeamSelector::Select(const double* values, int32_t count, int32_t width,
                          int32_t* beam) {
  above_.resize(count);
  for (int32_t s = 0; s < count; ++s) above_[s] = {s, values[s]};
  const size_t ranks = std::min<size_t>(count, width + 1 + kSpareRanks);
  std::nth_element(above_.begin(), above_.begin() + (ranks - 1), above_.end(),
                   Larger);
  const double lowest = above_[ranks - 1].value;
  above_.erase(std::partition(
                   above_.begin() + ranks, above_.end(),
                   [lowest](const BeamEntry& e) { return e.value >= lowest; }),
               above_.end());
  std::sort(above_.begin(), above_.end(), Larger);
  Finish(values, count, width, beam);
}

void BeamSelector::Reselect(const double* values, int32_t count,
                            const int32_t* changed, int32_t changed_count,
                            int32_t width, int32_t* beam) {
  if (!has_floor_) {
    Select(values, count, width, beam);
    return;
  }
  changed_.Grow(count);
  changed_.NextGeneration();
  fresh_.clear();
  for (int32_t i = 0; i < changed_count; ++i) {
    const int32_t s = changed[i];
    changed_.Mark(s);
    if (values[s] >= floor_) fresh_.push_back({s, values[s]});
  }
  std::sort(fresh_.begin(), fresh_.end(), Larger);
  ranked_.erase(std::remove_if(ranked_.begin(), ranked_.end(),
                               [this](const BeamEntry& e) {
                                 return changed_.Marked(e.state);
                               }),
                ranked_.end());
  above_.resize(ranked_.size() + fresh_.size());
  std::merge(ranked_.begin(), ranked_.end(), fresh_.begin(), fresh_.end(),
             above_.begin(), Larger);
  // Too few left at or above the floor to tell the beam.
  if (above_.size() <= static_cast<size_t>(width)) {
    Select(values, count, width, beam);
    return;
  }
  Finish(values, count, width, beam);
}

void BeamSelector::Finish(const double* values, int32_t count, int32_t width,
                          int32_t* beam) {
  // Only a value below the beam shows that the beam's values are above all
  // the others.
  // The heap keeps exactly these and pops them in ascending order; written
  // while checking, and overwritten by the heap if the check fails.
  bool distinct = above_.size() > static_cast<size_t>(width);
  if (distinct) {
    const BeamEntry* const ranked = above_.data();
    for (int32_t k = 0; k < width; ++k) {
      distinct &= ranked[k].value > ranked[k + 1].value;
      beam[width - 1 - k] = ranked[k].state;
    }
  }
  has_floor_ = distinct;
  if (!distinct) {
    SelectByHeap(values, count, width, beam);
    return;
  }
  // Spare ranks below the beam, so that the next row usually still has
  // more than width values at or above the floor.
  floor_ = above_[std::min(above_.size() - 1, width + kSpareRanks)].value;
  size_t ranks = width + 1;
  while (ranks < above_.size() && above_[ranks].value >= floor_) ++ranks;
  ranked_.assign(above_.begin(), above_.begin() + ranks);
}

void BeamSelector::SelectByHeap(const double* values, int32_t count,
                                int32_t width, int32_t* beam) {
  heap_.clear();
  for (int32_t s = 0; s < count; ++s) {
    if (static_cast<int32_t>(heap_.size()) < width) {
      Push(s, values[s]);
    } else if (!(heap_[0].value >= values[s])) {
      Pop();
      Push(s, values[s]);
    }
  }
  for (int32_t k = 0; k < width; ++k) beam[k] = Pop().state;
}

void BeamSelector::Push(int32_t state, double value) {
  size_t i = heap_.size();
  heap_.push_back({state, value});
  while (i > 0 && !(value >= heap_[(i - 1) / 2].value)) {
    heap_[i] = heap_[(i - 1) / 2];
    i = (i - 1) / 2;
  }
  heap_[i] = {state, value};
}

BeamEntry BeamSelector::Pop() {
  const BeamEntry root = heap_[0];
  const BeamEntry sifted = heap_.back();
  const size_t size = heap_.size() - 1;
  size_t i = 0;
  for (size_t child = 1; child < size; child = 2 * i + 1) {
    if (child + 1 < size && !(heap_[child + 1].value >= heap_[child].value)) {
      ++child;
    }
    if (!(sifted.value >= heap_[child].value)) break;
    heap_[i] = heap_[child];
    i = child;
  }
  heap_[i] = sifted;
  heap_.pop_back();
  return root;
}

}  // namespace apm
