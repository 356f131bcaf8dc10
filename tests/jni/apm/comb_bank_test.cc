#include "jni/apm/comb_bank.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>

#include "jni/apm/tempo_model.h"

namespace apm {
namespace {

float Expected(double y) { return static_cast<float>(std::exp(std::log(y))); }

bool SameBits(float a, float b) { return std::memcmp(&a, &b, sizeof(a)) == 0; }

// The shortcut must round as exp(log(y)) does, above all where y lies
// a few ulps from halfway between two floats, the one place they differ.
TEST(CombBank, FloatOfExpRoundsAsExpOfLog) {
  const float floats[] = {1e-5f, 0.1f, 0.75f, 1.0f, 1.5f, 3.0f, 1000.0f};
  // In ulps of the double, up to the float's own half spacing.
  const int64_t steps[] = {0, 1, -1, 3, -3, 1 << 13, -(1 << 13), 1 << 15, -(1 << 15),
                           (1 << 28) - 1};
  for (const float f : floats) {
    const double halfway = (static_cast<double>(f) + std::nextafter(f, 2e30f)) / 2;
    for (const int64_t step : steps) {
      int64_t bits;
      std::memcpy(&bits, &halfway, sizeof(bits));
      bits += step;
      double y;
      std::memcpy(&y, &bits, sizeof(y));
      EXPECT_TRUE(SameBits(FloatOfExp(y, std::log(y)), Expected(y))) << y;
    }
  }

  // A power of two and its neighbours; the comb's own range; then what
  // only exp can tell: nothing positive, not finite, out of float range.
  const double others[] = {1.0, std::nextafter(1.0, 0.0), std::nextafter(1.0, 2.0),
                           kLogFloor, 1.0 + kLogFloor, 0.0, -0.5,
                           std::numeric_limits<double>::quiet_NaN(),
                           std::numeric_limits<double>::infinity(), 1e-40, 1e40};
  for (const double y : others) {
    EXPECT_TRUE(SameBits(FloatOfExp(y, std::log(y)), Expected(y))) << y;
  }

  // A sweep over products of the comb's kind.
  uint32_t random = 5;
  for (int i = 0; i < 200000; ++i) {
    random = random * 1664525u + 1013904223u;
    const double y = static_cast<float>(random >> 8) / (1 << 24) + kLogFloor;
    ASSERT_TRUE(SameBits(FloatOfExp(y, std::log(y)), Expected(y))) << y;
  }
}

}  // namespace
}  // namespace apm
