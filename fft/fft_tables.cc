#include "fft/fft_tables.h"

#include <cmath>

namespace fft_internal {
namespace {

constexpr double kQuarterPi = 0.7853981633974483;

void BuildTwiddleRegion(int nw, int* work, double* w) {
  work[0] = nw;
  work[1] = 1;
  if (nw <= 2) return;
  int h = nw >> 1;
  const double delta = kQuarterPi / h;
  w[0] = 1;
  w[1] = std::cos(kQuarterPi);
  if (h == 4) {
    w[2] = std::cos(2 * delta);
    w[3] = std::sin(2 * delta);
  } else if (h > 4) {
    w[2] = 0.5 / std::cos(2 * delta);
    w[3] = 0.5 / std::cos(6 * delta);
    for (int j = 4; j < h; j += 4) {
      w[j] = std::cos(j * delta);
      w[j + 1] = std::sin(j * delta);
      w[j + 2] = std::cos(3 * j * delta);
      w[j + 3] = -std::sin(3 * j * delta);
    }
  }
  // Each shorter length reuses every other entry of the one before it.
  double* parent = w;
  while (h > 2) {
    double* sub = parent + h;
    h >>= 1;
    sub[0] = 1;
    sub[1] = w[1];
    if (h == 4) {
      sub[2] = parent[4];
      sub[3] = parent[5];
    } else if (h > 4) {
      sub[2] = 0.5 / parent[4];
      sub[3] = 0.5 / parent[6];
      for (int j = 4; j < h; j += 4) {
        sub[j] = parent[2 * j];
        sub[j + 1] = parent[2 * j + 1];
        sub[j + 2] = parent[2 * j + 2];
        sub[j + 3] = parent[2 * j + 3];
      }
    }
    parent = sub;
  }
}

void BuildCosineRegion(int nc, double* c) {
  if (nc <= 1) return;
  const int h = nc >> 1;
  const double delta = kQuarterPi / h;
  c[0] = c[1] = 0.5 * std::cos(kQuarterPi);
  for (int j = 1; j < h; ++j) {
    c[2 * j] = 0.5 * std::cos(j * delta);
    c[2 * j + 1] = 0.5 * std::sin(j * delta);
  }
}

}  // namespace

void EnsureTables(int n, int* work, double* w) {
  int nw = work[0];
  if (n > 4 * nw) {
    nw = n >> 2;
    BuildTwiddleRegion(nw, work, w);
  }
  if (n > 4 * work[1]) {
    const int nc = n >> 2;
    BuildCosineRegion(nc, w + nw);
    work[1] = nc;
  }
}

}  // namespace fft_internal
