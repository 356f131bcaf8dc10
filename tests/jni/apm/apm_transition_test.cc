#include "jni/apm/apm_transition.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <functional>
#include <limits>
#include <vector>

namespace apm {
namespace {

// A score table like the tracker's at 100 frames per second: from a
// difference of 5 on, every entry is log(1e-5).
std::vector<double> Gaussian(double weight) {
  std::vector<double> table(100);
  for (int d = 0; d < 100; ++d) {
    const double x = d * 10.0;
    table[d] = std::log(weight * std::exp(x * x / (5.0 * (5.0 * -2.0))) + 1e-5);
  }
  return table;
}

// Bases an ulp or a few apart, or equal, next to a binade boundary of the
// sums, so that many scores tie after rounding.
// The grouped scoring of the on-beat states against the library's own
// entry-by-entry scorer.
TEST(ApmTransition, GroupedScoringMatchesScoringEachState) {
  const std::vector<std::vector<double>> tables[] = {
      {Gaussian(0.5), Gaussian(0.9)},
      {{-1.0, -3.0}, {-0.5, -2.0, -2.0}},
      {{-1.0, -2.0, -3.0, -4.0}, {-0.25}},
      {{-2.0}, {-1.0, -1.0, -3.0, -7.0}},
      // Keys of the two phase classes a period gain apart.
      {{-1.0, -3.0}, {0.0, -2.0}},
      // Some near lags worse than far ones.
      {{-4.0, 0.5, -1.0}, {-3.0, -0.5, -1.0}},
      {{0.5, -4.0, -1.0}, {-0.5, -3.0, -1.0}}};
  uint32_t random = 17;
  const auto next = [&random](uint32_t n) {
    random = random * 1664525u + 1013904223u;
    return (random >> 8) % n;
  };
  int differing = 0;
  int fallbacks = 0;
  for (int round = 0; round < 1400; ++round) {
    const std::vector<std::vector<double>>& t = tables[round % 7];
    const int lags = round % 3 == 0 ? 76 : 3 + next(20);
    const int count = std::vector<int>{1, 2, 9, 100}[next(4)];
    std::vector<double> base(count);
    std::vector<int32_t> lag(count);
    std::vector<int32_t> offset(count);
    for (int k = 0; k < count; ++k) {
      switch (round % 3) {
        case 0:  // spread out
          base[k] = 1000.0 + next(4000) / 100.0;
          break;
        case 1:  // a few ulps around a few values
          base[k] = 1020.0 + next(3);
          for (uint32_t n = next(4); n > 0; --n) {
            base[k] = std::nextafter(base[k], 2000.0);
          }
          break;
        default:  // a few values, exactly
          base[k] = 1000.0 + 8 * next(3);
      }
      lag[k] = next(lags);
      offset[k] = static_cast<int32_t>(next(13)) - 6;
    }
    // Mostly in the ascending order the beam has; else descending or mixed.
    if (round % 5 > 1) std::sort(base.begin(), base.end());
    if (round % 5 == 1) std::sort(base.begin(), base.end(), std::greater<double>());
    std::vector<double> observation(lags);
    std::vector<double> prior(lags);
    for (int j = 0; j < lags; ++j) {
      observation[j] = round % 2 ? 4.0 + next(3) : next(1600) / 100.0;
      prior[j] = round % 4 == 1 ? 0.0 : -(next(300) / 100.0);
    }
    TransitionScorer grouped;
    grouped.SetUp(lags, 6, t[0], t[1]);
    std::vector<double> best(lags);
    std::vector<int32_t> from(lags);
    const BeamEntries entries{base.data(), lag.data(), offset.data(), count};
    std::vector<double> expected_best(lags, -std::numeric_limits<double>::infinity());
    std::vector<int32_t> expected_from(lags, -1);
    for (int j = 0; j < lags; ++j) {
      grouped.ScoreState(entries, j, 0, observation[j], prior[j], &expected_best[j],
                         &expected_from[j]);
    }
    if (!grouped.ScoreOnBeat(entries, observation.data(), prior.data(),
                             best.data(), from.data())) {
      ++fallbacks;
      continue;
    }
    differing += std::memcmp(best.data(), expected_best.data(),
                             lags * sizeof(double)) != 0 ||
                 from != expected_from;
  }
  EXPECT_EQ(differing, 0);
  EXPECT_EQ(fallbacks, 0);

  // Not finite, or large enough to overflow: left to the caller.
  TransitionScorer grouped;
  grouped.SetUp(3, 0, {-1.0}, {-1.0});
  const int32_t lag[] = {0};
  const int32_t offset[] = {0};
  const double observation[] = {0.0, 0.0, 0.0};
  double best[3];
  int32_t from[3];
  for (double base :
       {std::nan(""), std::numeric_limits<double>::infinity(), 1e301}) {
    EXPECT_FALSE(grouped.ScoreOnBeat({&base, lag, offset, 1}, observation,
                                     observation, best, from));
  }
  grouped.SetUp(3, 0, {-1.0, std::nan("")}, {-1.0});
  const double base = 0.0;
  EXPECT_FALSE(grouped.ScoreOnBeat({&base, lag, offset, 1}, observation,
                                   observation, best, from));
}

}  // namespace
}  // namespace apm
