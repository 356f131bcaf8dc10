#include "jni/apm/beam_selector.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

namespace apm {
namespace {

// The beam is the order in which a min-heap fed in index order pops its
// entries, so equal values come out in the heap's own order. Expected beams
// from a separate model of the heap's push, pop and skip rules.
TEST(BeamSelector, LiteralHeapOrderOnTies) {
  const struct {
    std::vector<double> values;
    int32_t width;
    std::vector<int32_t> beam;
  } cases[] = {
      {{0, 0, 0, 0}, 4, {0, 1, 3, 2}},
      {{0, 0, 0, 0, 0}, 5, {0, 1, 3, 4, 2}},
      {{0, 0, 0, 0, 0, 0, 0}, 7, {0, 1, 3, 6, 5, 4, 2}},
      {{1, 0, 1, 0, 1, 0}, 6, {1, 3, 5, 0, 2, 4}},
      {{2, 1, 1, 1, 1, 2, 2}, 4, {2, 0, 6, 5}},
      {{1, 1, 1, 1, 1, 1, 1, 1}, 3, {0, 1, 2}},  // equal to the root: skipped
      {{3, 1, 4, 1, 5, 9, 2, 6, 5, 3}, 3, {4, 7, 5}},
      {{5, 5, 1, 5, 5, 1, 5}, 5, {1, 3, 4, 6, 0}},
      {{0, 1, 0, 1, 0, 1, 0, 1}, 4, {1, 5, 7, 3}},
      {{2, 2, 2, 1, 1, 1, 3, 3}, 6, {5, 1, 2, 0, 7, 6}},
  };
  for (const auto& c : cases) {
    const int32_t count = static_cast<int32_t>(c.values.size());
    std::vector<int32_t> heap(c.width), select(c.width), reselect(c.width);
    BeamSelector a, b, d;
    a.SelectByHeap(c.values.data(), count, c.width, heap.data());
    b.Select(c.values.data(), count, c.width, select.data());
    d.Reselect(c.values.data(), count, nullptr, 0, c.width, reselect.data());
    SCOPED_TRACE(testing::PrintToString(c.values));
    EXPECT_EQ(heap, c.beam);
    EXPECT_EQ(select, c.beam);
    EXPECT_EQ(reselect, c.beam);
  }
}

// Rows drifting from frame to frame like the tracker's, now and then with
// a tie near the edge of the beam: both shortcuts must match the heap.
TEST(BeamSelector, ShortcutsAgreeWithTheHeap) {
  constexpr int kCount = 400;
  constexpr int kWidth = 30;
  uint32_t random = 99;
  const auto next = [&random] {
    return (random = random * 1664525u + 1013904223u) >> 8;
  };
  std::vector<double> row(kCount);
  for (double& v : row) v = next() % 100000;
  BeamSelector full, incremental, heap;
  std::vector<int32_t> a(kWidth), b(kWidth), c(kWidth);
  for (int frame = 0; frame < 3000; ++frame) {
    std::vector<int32_t> changed;
    const auto change = [&](int32_t s, double v) {
      row[s] = v;
      if (std::find(changed.begin(), changed.end(), s) == changed.end()) {
        changed.push_back(s);
      }
    };
    // Mostly small steps; now and then a jump from the bottom to the top
    // or back, and a whole beam falling below the floor.
    for (int i = 0; i < 20; ++i) {
      const int32_t s = next() % kCount;
      change(s, row[s] + next() % 2000 - 1000.0);
    }
    if (frame % 11 == 0) change(next() % kCount, 200000 - frame);
    if (frame % 13 == 0) change(b[next() % kWidth], -5000);
    if (frame % 97 == 0) {
      for (int32_t s : b) change(s, row[s] - 150000);
    }
    if (frame % 7 == 0) {
      std::vector<double> sorted = row;
      std::sort(sorted.begin(), sorted.end());
      change(next() % kCount, sorted[kCount - kWidth - 2 + next() % 4]);
    }
    full.Select(row.data(), kCount, kWidth, a.data());
    heap.SelectByHeap(row.data(), kCount, kWidth, b.data());
    incremental.Reselect(row.data(), kCount, changed.data(),
                         static_cast<int32_t>(changed.size()), kWidth, c.data());
    ASSERT_EQ(a, b) << frame;
    ASSERT_EQ(c, b) << frame;
  }
}

}  // namespace
}  // namespace apm
