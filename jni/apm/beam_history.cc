#include "jni/apm/beam_history.h"

#include <algorithm>

namespace apm {
namespace {

// Frames between merge checks at least; a check walks back over the kept
// rows, so with a long undecided stretch they come further apart.
constexpr int32_t kCheckInterval = 512;

}  // namespace

void BeamHistory::Reset(int32_t width, int32_t frame_count,
                        bool keep_every_row) {
  width_ = width;
  keep_every_row_ = keep_every_row;
  last_row_ = 0;
  decided_ = 0;
  last_check_ = 0;
  states_.clear();
  predecessors_.clear();
  path_.assign(frame_count, 0);
  broken_.clear();
  position_.assign(static_cast<size_t>(kNoPredecessor) + 1, -1);
  // One more, for -1.
  way_mark_.Reset(static_cast<size_t>(kNoPredecessor) + 2);
}

const uint16_t* BeamHistory::states(int32_t t) const {
  return states_.data() + static_cast<size_t>(t - decided_ - 1) * width_;
}

const uint16_t* BeamHistory::predecessors(int32_t t) const {
  return predecessors_.data() + static_cast<size_t>(t - decided_ - 1) * width_;
}

void BeamHistory::Append(const int32_t* beam, const int32_t* predecessor) {
  ++last_row_;
  states_.resize(states_.size() + width_);
  predecessors_.resize(predecessors_.size() + width_);
  uint16_t* row = states_.data() + states_.size() - width_;
  uint16_t* from = predecessors_.data() + predecessors_.size() - width_;
  for (int32_t k = 0; k < width_; ++k) {
    const int32_t s = beam[k];
    row[k] = static_cast<uint16_t>(s);
    // -1 wraps to kNoPredecessor.
    from[k] = static_cast<uint16_t>(predecessor[s]);
  }
  const int32_t undecided = last_row_ - decided_;
  if (!keep_every_row_ &&
      last_row_ - last_check_ >= std::max(kCheckInterval, undecided / 2)) {
    last_check_ = last_row_;
    CheckForMerge();
  }
}

bool BeamHistory::Follow(int32_t t, int32_t* state) {
  const uint16_t* row = states(t);
  int32_t s = *state;
  // From the end, where a row keeps its best states and the path mostly
  // runs; a row holds a state once, so this finds the same entry.
  int32_t k = width_ - 1;
  while (k >= 0 && row[k] != s) --k;
  const bool found = k >= 0;
  if (!found) {
    k = width_ - 1;
    if (s == -1) s = row[k];
  }
  path_[t - 1] = s;
  const uint16_t predecessor = predecessors(t)[k];
  *state = predecessor == kNoPredecessor ? -1 : predecessor;
  return found;
}

bool BeamHistory::WasBroken(int32_t t) const {
  return std::binary_search(broken_.begin(), broken_.end(), t);
}

void BeamHistory::AddWay(int32_t state, std::vector<int32_t>* ways) {
  if (way_mark_.Mark(static_cast<size_t>(state + 1))) ways->push_back(state);
}

int32_t BeamHistory::StepBack(int32_t t, int32_t s) const {
  // A position left from another row holds a different state there.
  int32_t k = s == -1 ? -1 : position_[s];
  if (k == -1 || states(t)[k] != s) k = width_ - 1;
  const uint16_t predecessor = predecessors(t)[k];
  return predecessor == kNoPredecessor ? -1 : predecessor;
}

// Whatever state the final backtrack enters the newest row in, it leaves
// it in the predecessor of one of the row's entries; those ways back are
// followed down until they meet.
void BeamHistory::CheckForMerge() {
  way_mark_.NextGeneration();
  ways_.clear();
  const uint16_t* newest = predecessors(last_row_);
  for (int32_t k = 0; k < width_; ++k) {
    AddWay(newest[k] == kNoPredecessor ? -1 : newest[k], &ways_);
  }
  for (int32_t t = last_row_ - 1; t > decided_; --t) {
    if (ways_.size() == 1) {
      Settle(t, ways_[0]);
      return;
    }
    const uint16_t* row = states(t);
    // Backwards, so that a state found twice keeps its first position.
    for (int32_t k = width_ - 1; k >= 0; --k) position_[row[k]] = k;
    way_mark_.NextGeneration();
    next_ways_.clear();
    for (const int32_t s : ways_) AddWay(StepBack(t, s), &next_ways_);
    ways_.swap(next_ways_);
  }
}

// Backtracks rows merge_row down to the last decided one, entering in
// state, and drops them.
void BeamHistory::Settle(int32_t merge_row, int32_t state) {
  const size_t first_new = broken_.size();
  for (int32_t t = merge_row; t > decided_; --t) {
    if (!Follow(t, &state)) broken_.push_back(t);
  }
  std::reverse(broken_.begin() + first_new, broken_.end());
  const size_t dropped = static_cast<size_t>(merge_row - decided_) * width_;
  states_.erase(states_.begin(), states_.begin() + dropped);
  predecessors_.erase(predecessors_.begin(), predecessors_.begin() + dropped);
  decided_ = merge_row;
}

}  // namespace apm
