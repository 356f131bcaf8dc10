#include "jni/apm/beam_history.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <utility>
#include <vector>

namespace apm {
namespace {

// The path and the rows with broken links, from the newest row down.
std::pair<std::vector<int32_t>, std::vector<int32_t>> Backtrack(BeamHistory history, int32_t rows,
                                                                int32_t state) {
  std::vector<int32_t> broken;
  for (int32_t t = rows; t >= 1; --t) {
    const bool linked =
        t > history.decided() ? history.Follow(t, &state) : !history.WasBroken(t);
    if (!linked) broken.push_back(t);
  }
  return {history.path(), broken};
}

// Random beams whose entries descend mostly from the best two of the last
// beam, or mostly from the entry in their own place (ways back that run side
// by side for long), else from any entry, now and then from a state outside
// the beam (a broken link) or from none: dropping decided rows must not
// change any way back.
TEST(BeamHistory, DroppingDecidedRowsKeepsEveryWayBack) {
  constexpr int32_t kWidth = 5;
  constexpr int32_t kRows = 3000;
  const struct {
    int32_t from_best_two, from_own_place;  // percent
  } mixes[] = {{90, 0}, {5, 85}};
  for (const auto& mix : mixes) {
    SCOPED_TRACE(mix.from_best_two);
    uint32_t random = 3;
    const auto next = [&random](uint32_t n) {
      random = random * 1664525u + 1013904223u;
      return static_cast<int32_t>((random >> 8) % n);
    };
    BeamHistory compacted, full;
    compacted.Reset(kWidth, kRows, false);
    full.Reset(kWidth, kRows, true);
    std::vector<int32_t> last = {0, 1, 2, 3, 4}, beam(kWidth), predecessor(40);
    for (int32_t t = 1; t <= kRows; ++t, last = beam) {
      for (int32_t k = 0; k < kWidth; ++k) {
        const int32_t s = 8 * k + next(8);  // distinct within the beam
        beam[k] = s;
        const int32_t pick = next(100);
        predecessor[s] = pick < mix.from_best_two ? last[kWidth - 1 - next(2)]
                         : pick < mix.from_best_two + mix.from_own_place ? last[k]
                         : pick < 97 ? last[next(kWidth)]
                         : pick < 99 ? 39
                                     : -1;
      }
      compacted.Append(beam.data(), predecessor.data());
      full.Append(beam.data(), predecessor.data());
    }
    EXPECT_GT(compacted.decided(), kRows / 2);
    EXPECT_EQ(full.decided(), 0);
    for (int32_t start : {-1, 0, 39, beam[0], beam[kWidth - 1]}) {
      const auto expected = Backtrack(full, kRows, start);
      EXPECT_EQ(Backtrack(compacted, kRows, start), expected) << start;
      EXPECT_FALSE(expected.second.empty()) << start;
    }
  }
}

}  // namespace
}  // namespace apm
