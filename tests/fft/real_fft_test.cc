#include "fft/real_fft.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "base/instruction_set.h"
#include "fft/complex_ops.h"
#include "fft/real_transform.h"
#include "fft/real_transform_avx.h"

namespace {

constexpr double kQuarterPi = 0.7853981633974483;
constexpr double kTwoPi = 6.283185307179586;
constexpr double kGuard = -12345.25;
constexpr int kGuardCount = 8;

// Work areas of exactly the documented sizes, followed by guard values.
struct Workspace {
  explicit Workspace(int n)
      : work_size(2 + static_cast<int>(std::sqrt(n / 2.0))),
        table_size(n / 2),
        work(work_size + kGuardCount, -7),
        table(table_size + kGuardCount, kGuard) {
    std::fill(work.begin(), work.begin() + work_size, 0);
  }
  void Run(int n, int direction, double* data) {
    RealFft(n, direction, data, work.data(), table.data());
  }
  bool GuardsIntact() const {
    return std::count(work.begin() + work_size, work.end(), -7) == kGuardCount &&
           std::count(table.begin() + table_size, table.end(), kGuard) == kGuardCount;
  }
  int work_size;
  int table_size;
  std::vector<int> work;
  std::vector<double> table;
};

std::vector<double> Noise(int n, unsigned seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<double> value(-1.0, 1.0);
  std::vector<double> x(n);
  for (double& v : x) v = value(random);
  return x;
}

// Direct O(n^2) transform in the same packing (plus sine), with exactly
// reduced angles.
std::vector<double> DirectDft(const std::vector<double>& x) {
  const int n = static_cast<int>(x.size());
  std::vector<double> packed(n);
  for (int k = 0; k <= n / 2; ++k) {
    double re = 0, im = 0;
    for (int j = 0; j < n; ++j) {
      const double angle = kTwoPi * static_cast<double>(static_cast<long long>(j) * k % n) / n;
      re += x[j] * std::cos(angle);
      im += x[j] * std::sin(angle);
    }
    packed[k == n / 2 ? 1 : 2 * k] = re;
    if (k != 0 && k != n / 2) packed[2 * k + 1] = im;
  }
  return packed;
}

// Forward within `relative` of the direct transform's largest value.
void ExpectDft(const std::vector<double>& x, const double* actual, double relative) {
  const std::vector<double> expected = DirectDft(x);
  double scale = 0;
  for (double v : expected) scale = std::max(scale, std::fabs(v));
  for (size_t k = 0; k < x.size(); ++k) ASSERT_NEAR(actual[k], expected[k], relative * scale) << k;
}

// Forward matches the direct transform and backward inverts it. Every kernel
// the machine can run gives the bits of the plain two-lane one, so that a
// spectrum does not depend on where it was computed.
TEST(RealFft, MatchesDirectTransformInvertsAndGivesThePlainBitsOnEveryPath) {
  using Transform = void (*)(int, int, double*, const int*, const double*);
  std::vector<Transform> paths = {fft_internal::RealTransform<fft_internal::Double2>};
#if defined(__x86_64__)
  if (instruction_set::HasAvx()) paths.push_back(fft_internal::RealTransformAvx);
#endif
  for (int n = 2; n <= 65536; n *= 2) {
    SCOPED_TRACE(n);
    const std::vector<double> x = Noise(n, n);
    Workspace space(n);
    std::vector<double> data = x;
    data.resize(n + kGuardCount, kGuard);
    space.Run(n, 1, data.data());
    if (n <= 4096) ExpectDft(x, data.data(), 1e-12);
    space.Run(n, -1, data.data());
    for (int k = 0; k < n; ++k) ASSERT_NEAR(data[k] * 2 / n, x[k], 1e-13) << k;
    for (int k = n; k < n + kGuardCount; ++k) ASSERT_EQ(data[k], kGuard);
    ASSERT_TRUE(space.GuardsIntact());
    // Also with tables built for a longer transform, as shorter lengths
    // take them.
    Workspace longer(4 * n);
    longer.Run(4 * n, 1, Noise(4 * n, 1).data());
    for (const Workspace* tables : {&space, &longer}) {
      for (size_t path = 0; path < paths.size(); ++path) {
        for (int direction : {1, -1}) {
          std::vector<double> actual = Noise(n, 5 * n);
          std::vector<double> plain = actual;
          paths[path](n, direction, actual.data(), tables->work.data(), tables->table.data());
          fft_internal::RealTransform<fft_internal::PlainDouble2>(
              n, direction, plain.data(), tables->work.data(), tables->table.data());
          ASSERT_EQ(std::memcmp(actual.data(), plain.data(), n * sizeof(double)), 0)
              << "path " << path << ", direction " << direction << ", tables "
              << tables->table_size;
        }
      }
    }
  }
}

// Tables built for 256 give way to those for 2048, entry by entry; these
// then serve every shorter length untouched.
TEST(RealFftTables, LongerLengthsRebuildAndShorterOnesReuse) {
  Workspace space(2048);
  space.Run(256, 1, Noise(256, 4).data());
  EXPECT_EQ(space.work[0], 64);
  EXPECT_EQ(space.work[1], 64);
  space.Run(2048, 1, Noise(2048, 1).data());
  EXPECT_EQ(space.work[0], 512);
  EXPECT_EQ(space.work[1], 512);
  const double* w = space.table.data();
  const double delta = kQuarterPi / 256;
  EXPECT_EQ(w[0], 1.0);
  EXPECT_EQ(w[1], 0.7071067811865476);
  EXPECT_EQ(w[2], 0.5 / std::cos(2 * delta));
  EXPECT_EQ(w[3], 0.5 / std::cos(6 * delta));
  for (int j = 4; j < 256; j += 4) {
    ASSERT_EQ(w[j], std::cos(j * delta)) << j;
    ASSERT_EQ(w[j + 1], std::sin(j * delta)) << j;
    ASSERT_EQ(w[j + 2], std::cos(3 * j * delta)) << j;
    ASSERT_EQ(w[j + 3], -std::sin(3 * j * delta)) << j;
  }
  // Each halved copy, of size h at offset 512 - 2h, is the table a build for
  // length 8h makes, so shorter lengths get the bits they would alone.
  for (int h = 128; h >= 2; h /= 2) {
    Workspace fresh(8 * h);
    fresh.Run(8 * h, 1, Noise(8 * h, 1).data());
    EXPECT_TRUE(std::equal(w + 512 - 2 * h, w + 512 - h, fresh.table.begin())) << h;
  }
  const double* c = w + 512;
  EXPECT_EQ(c[0], 0.5 * 0.7071067811865476);
  EXPECT_EQ(c[1], c[0]);
  for (int j = 1; j < 256; ++j) {
    ASSERT_EQ(c[2 * j], 0.5 * std::cos(j * delta)) << j;
    ASSERT_EQ(c[2 * j + 1], 0.5 * std::sin(j * delta)) << j;
  }
  EXPECT_TRUE(space.GuardsIntact());

  // A marked entry survives: shorter lengths rebuild nothing and still find
  // their own twiddles and weights, both ways.
  space.table[100] = 0.25;
  for (int n = 4; n <= 1024; n *= 2) {
    SCOPED_TRACE(n);
    const std::vector<double> x = Noise(n, 3 * n);
    std::vector<double> shorter = x;
    space.Run(n, 1, shorter.data());
    ExpectDft(x, shorter.data(), 1e-12);
    space.Run(n, -1, shorter.data());
    for (int k = 0; k < n; ++k) ASSERT_NEAR(shorter[k] * 2 / n, x[k], 1e-13) << k;
  }
  EXPECT_EQ(space.table[100], 0.25);
}

}  // namespace
