#include "fft/real_fft.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <functional>
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
    for (int k = 0; k < kGuardCount; ++k) {
      if (work[work_size + k] != -7 || table[table_size + k] != kGuard) return false;
    }
    return true;
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
  std::vector<double> cosine(n), sine(n), packed(n);
  for (int r = 0; r < n; ++r) {
    cosine[r] = std::cos(kTwoPi * r / n);
    sine[r] = std::sin(kTwoPi * r / n);
  }
  for (int k = 0; k <= n / 2; ++k) {
    double re = 0, im = 0;
    for (int j = 0; j < n; ++j) {
      const int r = static_cast<int>(static_cast<long long>(j) * k % n);
      re += x[j] * cosine[r];
      im += x[j] * sine[r];
    }
    if (k == 0 || k == n / 2) {
      packed[k == 0 ? 0 : 1] = re;
    } else {
      packed[2 * k] = re;
      packed[2 * k + 1] = im;
    }
  }
  return packed;
}

std::vector<double> Forward(const std::vector<double>& x) {
  const int n = static_cast<int>(x.size());
  Workspace space(n);
  std::vector<double> data = x;
  space.Run(n, 1, data.data());
  return data;
}

TEST(RealFft, ForwardMatchesDirectTransformAndBackwardInvertsIt) {
  for (int n = 2; n <= 65536; n *= 2) {
    SCOPED_TRACE(n);
    const std::vector<double> x = Noise(n, n);
    Workspace space(n);
    std::vector<double> data = x;
    data.resize(n + kGuardCount, kGuard);
    space.Run(n, 1, data.data());
    if (n <= 4096) {
      const std::vector<double> expected = DirectDft(x);
      double scale = 0;
      for (double v : expected) scale = std::max(scale, std::fabs(v));
      for (int k = 0; k < n; ++k) ASSERT_NEAR(data[k], expected[k], 1e-12 * scale) << k;
    }
    space.Run(n, -1, data.data());
    for (int k = 0; k < n; ++k) ASSERT_NEAR(data[k] * 2 / n, x[k], 1e-13) << k;
    for (int k = n; k < n + kGuardCount; ++k) ASSERT_EQ(data[k], kGuard);
    ASSERT_TRUE(space.GuardsIntact());
  }
}

TEST(RealFft, SmallLengthsAreExact) {
  EXPECT_EQ(Forward({3, 5}), (std::vector<double>{8, -2}));
  const std::vector<double> four = Forward({1, 2, 4, 8});
  EXPECT_EQ(four, (std::vector<double>{1 + 2 + 4 + 8, 1 - 2 + 4 - 8, 1 - 4, 2 - 8}));
  Workspace space(4);
  std::vector<double> back = four;
  space.Run(4, -1, back.data());
  EXPECT_EQ(back, (std::vector<double>{2, 4, 8, 16}));
}

// Every kernel the machine can run gives the bits of the plain two-lane
// one, so that a spectrum does not depend on where it was computed.
TEST(RealFft, EveryVectorPathGivesThePlainBits) {
  using Transform = std::function<void(int, int, double*, const int*, const double*)>;
  std::vector<std::pair<const char*, Transform>> paths = {
      {"target two-lane", fft_internal::RealTransform<fft_internal::Double2>}};
#if defined(__x86_64__)
  if (instruction_set::HasAvx()) paths.emplace_back("AVX", fft_internal::RealTransformAvx);
#endif
  for (const auto& [name, transform] : paths) {
    for (int n = 2; n <= 65536; n *= 2) {
      SCOPED_TRACE(testing::Message() << name << ", " << n);
      Workspace space(n);
      space.Run(n, 1, Noise(n, 1).data());
      for (int direction : {1, -1}) {
        std::vector<double> actual = Noise(n, 5 * n);
        std::vector<double> plain = actual;
        transform(n, direction, actual.data(), space.work.data(), space.table.data());
        fft_internal::RealTransform<fft_internal::PlainDouble2>(
            n, direction, plain.data(), space.work.data(), space.table.data());
        ASSERT_EQ(std::memcmp(actual.data(), plain.data(), n * sizeof(double)), 0);
      }
    }
  }
}

TEST(RealFftTables, ContentsAfterBuildingFor2048) {
  Workspace space(2048);
  std::vector<double> data = Noise(2048, 1);
  space.Run(2048, 1, data.data());
  const int nw = 512, nc = 512;
  EXPECT_EQ(space.work[0], nw);
  EXPECT_EQ(space.work[1], nc);

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
  // Halved copies: size h at offset 512 - 2h, each taking every other entry
  // of its parent; the size-4 copy holds the parent's 4 and 5.
  for (int h = 128; h >= 2; h /= 2) {
    SCOPED_TRACE(h);
    const double* parent = w + nw - 4 * h;
    const double* sub = w + nw - 2 * h;
    EXPECT_EQ(sub[0], 1.0);
    EXPECT_EQ(sub[1], w[1]);
    if (h == 4) {
      EXPECT_EQ(sub[2], parent[4]);
      EXPECT_EQ(sub[3], parent[5]);
    } else if (h > 4) {
      EXPECT_EQ(sub[2], 0.5 / parent[4]);
      EXPECT_EQ(sub[3], 0.5 / parent[6]);
      for (int j = 4; j < h; ++j) ASSERT_EQ(sub[j], parent[2 * j - j % 4]) << j;
    }
  }
  const double* c = w + nw;
  EXPECT_EQ(c[0], 0.7071067811865476);
  EXPECT_EQ(c[256], 0.5 * c[0]);
  for (int j = 1; j < 256; ++j) {
    ASSERT_EQ(c[j], 0.5 * std::cos(j * delta)) << j;
    ASSERT_EQ(c[nc - j], 0.5 * std::sin(j * delta)) << j;
  }
  EXPECT_TRUE(space.GuardsIntact());
}

// Tables built for a length serve every shorter one untouched; a longer one
// rebuilds them as a fresh pair would.
TEST(RealFftTables, ShorterLengthsReuseAndLongerOnesRebuild) {
  Workspace space(2048);
  std::vector<double> data = Noise(256, 4);
  space.Run(256, 1, data.data());
  EXPECT_EQ(space.work[0], 64);
  EXPECT_EQ(space.work[1], 64);
  data = Noise(2048, 5);
  space.Run(2048, 1, data.data());
  EXPECT_EQ(data, Forward(Noise(2048, 5)));
  Workspace fresh(2048);
  fresh.Run(2048, 1, Noise(2048, 5).data());
  EXPECT_EQ(space.table, fresh.table);
  EXPECT_EQ(space.work, fresh.work);

  // A marked entry survives: nothing is rebuilt for shorter lengths, which
  // still find their own twiddles and weights.
  space.table[100] = 0.25;
  for (int n = 4; n <= 1024; n *= 2) {
    SCOPED_TRACE(n);
    std::vector<double> shorter = Noise(n, 3 * n);
    space.Run(n, 1, shorter.data());
    const std::vector<double> expected = Forward(Noise(n, 3 * n));
    for (int k = 0; k < n; ++k) ASSERT_NEAR(shorter[k], expected[k], 1e-12 * n) << k;
  }
  EXPECT_EQ(space.table[100], 0.25);
}

}  // namespace
