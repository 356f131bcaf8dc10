#include "jni/apm/beam_history.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

namespace apm {
namespace {

struct Backtracked {
  std::vector<int32_t> path;
  std::vector<int32_t> broken;
};

Backtracked Backtrack(BeamHistory* history, int32_t rows, int32_t state) {
  Backtracked result;
  for (int32_t t = rows; t >= 1; --t) {
    const bool linked = t > history->decided() ? history->Follow(t, &state)
                                               : !history->WasBroken(t);
    if (!linked) result.broken.push_back(t);
  }
  result.path = history->path();
  return result;
}

// Random beams whose entries mostly descend from the best two of the last
// beam, now and then from a state outside it (a broken link) or from none:
// dropping decided rows must not change any way back.
TEST(BeamHistory, DroppingDecidedRowsKeepsEveryWayBack) {
  constexpr int32_t kWidth = 5;
  constexpr int32_t kRows = 3000;
  uint32_t random = 3;
  const auto next = [&random](uint32_t n) {
    random = random * 1664525u + 1013904223u;
    return static_cast<int32_t>((random >> 8) % n);
  };
  std::vector<std::vector<int32_t>> beams(kRows + 1, std::vector<int32_t>(kWidth));
  std::vector<std::vector<int32_t>> predecessors(kRows + 1, std::vector<int32_t>(40, -1));
  for (int32_t k = 0; k < kWidth; ++k) beams[0][k] = k;
  for (int32_t t = 1; t <= kRows; ++t) {
    for (int32_t k = 0; k < kWidth; ++k) {
      const int32_t s = 8 * k + next(8);  // distinct within the beam
      beams[t][k] = s;
      const int32_t pick = next(100);
      predecessors[t][s] = pick < 90   ? beams[t - 1][kWidth - 1 - next(2)]
                           : pick < 97 ? beams[t - 1][next(kWidth)]
                           : pick < 99 ? 39
                                       : -1;
    }
  }
  BeamHistory compacted, full;
  compacted.Reset(kWidth, kRows, false);
  full.Reset(kWidth, kRows, true);
  for (int32_t t = 1; t <= kRows; ++t) {
    compacted.Append(beams[t].data(), predecessors[t].data());
    full.Append(beams[t].data(), predecessors[t].data());
  }
  EXPECT_GT(compacted.decided(), kRows / 2);
  EXPECT_EQ(full.decided(), 0);
  for (int32_t start : {-1, 0, 39, beams[kRows][0], beams[kRows][kWidth - 1]}) {
    BeamHistory compacted_copy = compacted;
    BeamHistory full_copy = full;
    const Backtracked a = Backtrack(&compacted_copy, kRows, start);
    const Backtracked b = Backtrack(&full_copy, kRows, start);
    EXPECT_EQ(a.path, b.path) << start;
    EXPECT_EQ(a.broken, b.broken) << start;
    EXPECT_FALSE(b.broken.empty()) << start;
  }
}

}  // namespace
}  // namespace apm
