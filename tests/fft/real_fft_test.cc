#include "fft/real_fft.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "fft/complex_ops.h"
#include "fft/real_transform.h"
#include "fft/real_transform_avx.h"
#include "base/instruction_set.h"

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

// Direct O(n^2) transform in the same packing, with exactly reduced angles.
std::vector<double> DirectDft(const std::vector<double>& x) {
  const int n = static_cast<int>(x.size());
  std::vector<double> cosine(n), sine(n);
  for (int r = 0; r < n; ++r) {
    cosine[r] = std::cos(kTwoPi * r / n);
    sine[r] = std::sin(kTwoPi * r / n);
  }
  std::vector<double> packed(n);
  for (int k = 0; k <= n / 2; ++k) {
    double re = 0, im = 0;
    for (int j = 0; j < n; ++j) {
      const int r = static_cast<int>(static_cast<long long>(j) * k % n);
      re += x[j] * cosine[r];
      im += x[j] * sine[r];
    }
    if (k == 0) {
      packed[0] = re;
    } else if (k == n / 2) {
      packed[1] = re;
    } else {
      packed[2 * k] = re;
      packed[2 * k + 1] = im;
    }
  }
  return packed;
}

double MaxAbs(const std::vector<double>& x) {
  double m = 0;
  for (double v : x) m = std::max(m, std::fabs(v));
  return m;
}

std::vector<double> Forward(const std::vector<double>& x) {
  const int n = static_cast<int>(x.size());
  Workspace space(n);
  std::vector<double> data = x;
  space.Run(n, 1, data.data());
  return data;
}

TEST(RealFft, ForwardMatchesDirectTransform) {
  for (int n = 2; n <= 4096; n *= 2) {
    SCOPED_TRACE(n);
    const std::vector<double> x = Noise(n, n);
    const std::vector<double> expected = DirectDft(x);
    const std::vector<double> actual = Forward(x);
    const double scale = MaxAbs(expected);
    for (int k = 0; k < n; ++k) {
      ASSERT_NEAR(actual[k], expected[k], 1e-12 * scale) << "element " << k;
    }
  }
}

TEST(RealFft, BackwardInvertsForwardUpToHalfLength) {
  for (int n = 2; n <= 65536; n *= 2) {
    SCOPED_TRACE(n);
    const std::vector<double> x = Noise(n, 7 * n);
    Workspace space(n);
    std::vector<double> data = x;
    data.resize(n + kGuardCount, kGuard);
    space.Run(n, 1, data.data());
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

// Only the named element may be nonzero.
void ExpectOnly(const std::vector<double>& data, int index, double value) {
  const double tolerance = 1e-12 * data.size();
  for (int k = 0; k < static_cast<int>(data.size()); ++k) {
    EXPECT_NEAR(data[k], k == index ? value : 0.0, tolerance) << "element " << k;
  }
}

TEST(RealFft, PureTonesLandInTheirBinsWithPlusSine) {
  for (int n = 2; n <= 4096; n *= 2) {
    SCOPED_TRACE(n);
    std::vector<double> constant(n, 1.5), alternating(n), sine(n), cosine(n);
    for (int j = 0; j < n; ++j) {
      alternating[j] = j % 2 ? -1 : 1;
      sine[j] = std::sin(kTwoPi * j / n);
      cosine[j] = std::cos(kTwoPi * j / n);
    }
    ExpectOnly(Forward(constant), 0, 1.5 * n);
    ExpectOnly(Forward(alternating), 1, n);
    if (n >= 4) {
      ExpectOnly(Forward(sine), 3, n / 2.0);
      ExpectOnly(Forward(cosine), 2, n / 2.0);
    }
  }
}

// The SIMD kernels must give exactly the bits of the plain ones, so that a
// spectrum does not depend on the target it was computed on.
TEST(RealFft, SimdKernelsGiveThePlainBits) {
  using fft_internal::PlainDouble2;
  auto same_bits = [](const std::vector<double>& a, const std::vector<double>& b) {
    return std::memcmp(a.data(), b.data(), a.size() * sizeof(double)) == 0;
  };
  for (int n = 2; n <= 65536; n *= 2) {
    SCOPED_TRACE(n);
    Workspace space(n);
    std::vector<double> simd = Noise(n, 5 * n);
    std::vector<double> plain = simd;
    space.Run(n, 1, simd.data());
    fft_internal::RealTransform<PlainDouble2>(n, 1, plain.data(), space.work.data(),
                                              space.table.data());
    ASSERT_TRUE(same_bits(simd, plain));
    space.Run(n, -1, simd.data());
    fft_internal::RealTransform<PlainDouble2>(n, -1, plain.data(), space.work.data(),
                                              space.table.data());
    ASSERT_TRUE(same_bits(simd, plain));
#if defined(__x86_64__)
    if (instruction_set::HasAvx()) {
      std::vector<double> wide = Noise(n, 5 * n);
      plain = wide;
      fft_internal::RealTransformAvx(n, 1, wide.data(), space.work.data(), space.table.data());
      fft_internal::RealTransform<PlainDouble2>(n, 1, plain.data(), space.work.data(),
                                                space.table.data());
      ASSERT_TRUE(same_bits(wide, plain));
      fft_internal::RealTransformAvx(n, -1, wide.data(), space.work.data(), space.table.data());
      fft_internal::RealTransform<PlainDouble2>(n, -1, plain.data(), space.work.data(),
                                                space.table.data());
      ASSERT_TRUE(same_bits(wide, plain));
    }
#endif
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
  const double cdelta = kQuarterPi / 256;
  EXPECT_EQ(c[0], 0.7071067811865476);
  EXPECT_EQ(c[256], 0.5 * c[0]);
  for (int j = 1; j < 256; ++j) {
    ASSERT_EQ(c[j], 0.5 * std::cos(j * cdelta)) << j;
    ASSERT_EQ(c[nc - j], 0.5 * std::sin(j * cdelta)) << j;
  }
  EXPECT_TRUE(space.GuardsIntact());
}

TEST(RealFftTables, ShorterTransformsReuseLongerTables) {
  Workspace space(2048);
  const std::vector<double> x = Noise(2048, 2);
  std::vector<double> first = x;
  space.Run(2048, 1, first.data());
  const std::vector<double> built = space.table;

  // Every shorter length finds its twiddles and split weights in the
  // longer tables.
  for (int n = 4; n <= 1024; n *= 2) {
    SCOPED_TRACE(n);
    const std::vector<double> y = Noise(n, 3 * n);
    std::vector<double> shorter = y;
    space.Run(n, 1, shorter.data());
    const std::vector<double> fresh = Forward(y);
    const double scale = MaxAbs(fresh);
    for (int k = 0; k < n; ++k) ASSERT_NEAR(shorter[k], fresh[k], 1e-14 * scale) << k;
    space.Run(n, -1, shorter.data());
    for (int k = 0; k < n; ++k) ASSERT_NEAR(shorter[k] * 2 / n, y[k], 1e-14) << k;
  }

  std::vector<double> again = x;
  space.Run(2048, 1, again.data());
  EXPECT_EQ(again, first);
  EXPECT_EQ(space.work[0], 512);
  EXPECT_EQ(space.work[1], 512);
  EXPECT_EQ(space.table, built);

  // A marked entry survives further calls: nothing is rebuilt.
  space.table[100] = 0.25;
  std::vector<double> shorter = Noise(256, 3);
  space.Run(256, 1, shorter.data());
  space.Run(2048, -1, again.data());
  EXPECT_EQ(space.table[100], 0.25);
}

TEST(RealFftTables, LongerTransformRebuildsBothRegions) {
  Workspace space(2048);
  std::vector<double> data = Noise(256, 4);
  space.Run(256, 1, data.data());
  EXPECT_EQ(space.work[0], 64);
  EXPECT_EQ(space.work[1], 64);

  const std::vector<double> x = Noise(2048, 5);
  data = x;
  space.Run(2048, 1, data.data());
  EXPECT_EQ(space.work[0], 512);
  EXPECT_EQ(space.work[1], 512);

  Workspace fresh(2048);
  std::vector<double> expected = x;
  fresh.Run(2048, 1, expected.data());
  EXPECT_EQ(space.table, fresh.table);
  EXPECT_EQ(space.work, fresh.work);
  EXPECT_EQ(data, expected);
}

}  // namespace
