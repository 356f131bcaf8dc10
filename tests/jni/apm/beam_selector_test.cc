#include "jni/apm/beam_selector.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

namespace apm {
namespace {

TEST(BeamSelector, HeapOrderForEqualValuesAndFullHeaps) {
  BeamSelector selector;
  const double equal[] = {0, 0, 0, 0, 0};
  std::vector<int32_t> beam(5);
  selector.Select(equal, 4, 4, beam.data());
  EXPECT_EQ(beam, (std::vector<int32_t>{0, 1, 3, 2, 0}));
  selector.Select(equal, 5, 5, beam.data());
  EXPECT_EQ(beam, (std::vector<int32_t>{0, 1, 3, 4, 2}));
  // Full: a value must exceed the root to get in; the two 5s tie.
  const double values[] = {3, 1, 4, 1, 5, 9, 2, 6, 5, 3};
  selector.Select(values, 10, 3, beam.data());
  EXPECT_EQ(beam, (std::vector<int32_t>{4, 7, 5, 4, 2}));
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
  BeamSelector full;
  BeamSelector incremental;
  BeamSelector heap;
  std::vector<int32_t> a(kWidth);
  std::vector<int32_t> b(kWidth);
  std::vector<int32_t> c(kWidth);
  int differing = 0;
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
                         static_cast<int32_t>(changed.size()), kWidth,
                         c.data());
    differing += (a != b) + (c != b);
  }
  EXPECT_EQ(differing, 0);
}

}  // namespace
}  // namespace apm
