#include "base/aligned_allocator.h"

#include <gtest/gtest.h>

#include <cstdint>

namespace {

// Every size, and every regrowth, starts on a line.
TEST(CacheLineVector, StartsOnALineAtAnySizeAndAfterGrowing) {
  CacheLineVector<double> values;
  for (size_t size : {1, 3, 8, 2050, 65538}) {
    values.assign(size, 1.0);
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(values.data()) % 64, 0u) << size;
    values.push_back(2.0);
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(values.data()) % 64, 0u) << size;
  }
  CacheLineVector<float> copy(values.begin(), values.end());
  EXPECT_EQ(reinterpret_cast<std::uintptr_t>(copy.data()) % 64, 0u);
  EXPECT_EQ(copy.back(), 2.0f);
}

}  // namespace
