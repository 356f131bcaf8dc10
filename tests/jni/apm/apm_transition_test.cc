#include "jni/apm/apm_transition.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <functional>
#include <limits>
#include <vector>

#include "jni/apm/tempo_model.h"

namespace apm {
namespace {

// The grouped scoring of the on-beat states against the library's own
// entry-by-entry scorer. Every input array holds a NaN just past its end,
// which a read beyond the count would turn into a fallback.
TEST(ApmTransition, GroupedScoringMatchesScoringEachState) {
  const std::vector<std::vector<double>> tables[] = {
      {TransitionScores(100, 0.5, 10.0, 5.0), TransitionScores(100, 0.9, 10.0, 5.0)},
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
  for (int round = 0; round < 1400; ++round) {
    const std::vector<std::vector<double>>& t = tables[round % 7];
    const int lags = round % 3 == 0 ? 76 : 3 + next(20);
    const int count = std::vector<int>{1, 2, 9, 100}[next(4)];
    std::vector<double> base(count + 1, NAN);
    std::vector<int32_t> lag(count), offset(count);
    for (int k = 0; k < count; ++k) {
      switch (round % 3) {
        case 0:  // spread out
          base[k] = 1000.0 + next(4000) / 100.0;
          break;
        case 1:  // a few ulps around a few values
          base[k] = 1020.0 + next(3);
          for (uint32_t n = next(4); n > 0; --n) base[k] = std::nextafter(base[k], 2000.0);
          break;
        default:  // a few values, exactly
          base[k] = 1000.0 + 8 * next(3);
      }
      lag[k] = next(lags);
      offset[k] = static_cast<int32_t>(next(13)) - 6;
    }
    // Mostly in the ascending order the beam has; else descending or mixed.
    if (round % 5 > 1) std::sort(base.begin(), base.end() - 1);
    if (round % 5 == 1) std::sort(base.begin(), base.end() - 1, std::greater<double>());
    TransitionScorer grouped;
    grouped.SetUp(lags, 6, t[0], t[1]);
    const BeamEntries entries{base.data(), lag.data(), offset.data(), count};
    std::vector<double> observation(lags + 1, NAN), prior(lags + 1, NAN), best(lags);
    std::vector<double> expected_best(lags, -std::numeric_limits<double>::infinity());
    std::vector<int32_t> from(lags), expected_from(lags, -1);
    for (int j = 0; j < lags; ++j) {
      observation[j] = round % 2 ? 4.0 + next(3) : next(1600) / 100.0;
      prior[j] = round % 4 == 1 ? 0.0 : -(next(300) / 100.0);
      grouped.ScoreState(entries, j, 0, observation[j], prior[j], &expected_best[j],
                         &expected_from[j]);
    }
    ASSERT_TRUE(
        grouped.ScoreOnBeat(entries, observation.data(), prior.data(), best.data(), from.data()))
        << round;
    ASSERT_EQ(std::memcmp(best.data(), expected_best.data(), lags * sizeof(double)), 0) << round;
    ASSERT_EQ(from, expected_from) << round;
  }

  // Not finite, or large enough to overflow, in a base or a table: left to
  // the caller.
  TransitionScorer grouped;
  const int32_t zero[] = {0};
  const double observation[] = {0.0, 0.0, 0.0};
  double best[3];
  int32_t from[3];
  for (const auto& [base, period] :
       {std::pair<double, double>{NAN, -1.0}, {INFINITY, -1.0}, {1e301, -1.0}, {0.0, NAN}}) {
    grouped.SetUp(3, 0, {-1.0, period}, {-1.0});
    EXPECT_FALSE(grouped.ScoreOnBeat({&base, zero, zero, 1}, observation, observation, best, from))
        << base;
  }
}

}  // namespace
}  // namespace apm
