#include "jni/apm/tempo_estimate.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <vector>

namespace apm {
namespace {

// count beats `period` seconds apart, from `start` or one period after the
// last of `before`.
std::vector<double> Steady(int count, double period, std::vector<double> before = {},
                           double start = 0.3) {
  if (!before.empty()) start = before.back() + period;
  for (int i = 0; i < count; ++i) before.push_back(start + i * period);
  return before;
}

std::vector<double> Jittered(int count, double period, double jitter) {
  std::mt19937 random(7);
  std::normal_distribution<double> offset(0, jitter);
  std::vector<double> beats = Steady(count, period);
  for (double& b : beats) b += offset(random);
  return beats;
}

std::vector<double> WithoutBeat(std::vector<double> beats, size_t index) {
  beats.erase(beats.begin() + index);
  return beats;
}

// Whole frames at 100 per second, as the tracker gives them.
std::vector<double> OnFrames(std::vector<double> beats) {
  for (double& b : beats) b = std::round(b * 100) / 100;
  return beats;
}

TEST(PreciseTempo, BeatLists) {
  const struct {
    const char* name;
    std::vector<double> beats;
    double bpm;  // NaN: no tempo
    double tolerance;
  } rows[] = {
      {"steady", Steady(30, 0.5), 120, 1e-9},
      {"steady slow", Steady(20, 1.0), 60, 1e-9},
      {"117.6 BPM on whole frames", OnFrames(Steady(60, 60 / 117.6)), 117.6, 0.05},
      {"jittered by 10 ms", Jittered(80, 0.5, 0.01), 120, 0.3},
      {"one beat missing", WithoutBeat(Steady(30, 0.5), 12), 120, 1e-9},
      {"first beat missing", WithoutBeat(Steady(30, 0.5), 1), 120, 1e-9},
      {"tempo change: the longer part", Steady(60, 60.0 / 130, Steady(40, 0.6)), 130, 1e-9},
      {"tempo change: the longer part first", Steady(40, 0.6, Steady(60, 60.0 / 130)), 130, 1e-9},
      // A tracker settling at a shorter period before it locks on stays out
      // of the fit but for its last beat, 40 ms off the line: fitted whole,
      // the run would read 100.44 BPM.
      {"settling", Steady(40, 0.6, Steady(8, 0.56, {}, 0.0)), 100, 0.03},
      {"three beats", Steady(3, 0.4), 150, 1e-9},
      // The median of an even count is the upper middle: 2 s, not 1 s.
      {"1 s twice, then 2 s twice", {0, 1, 2, 4, 6}, 30, 1e-9},
      {"two beats", Steady(2, 0.5), NAN, 0},
      {"one beat", Steady(1, 0.5), NAN, 0},
      {"no beats", {}, NAN, 0},
      {"nothing steady", {0, 0.5, 1.3, 1.6, 2.7, 3.0}, NAN, 0},
  };
  for (const auto& row : rows) {
    const double bpm = PreciseTempo(row.beats);
    if (std::isnan(row.bpm)) {
      EXPECT_TRUE(std::isnan(bpm)) << row.name << ": " << bpm;
    } else {
      EXPECT_NEAR(bpm, row.bpm, row.tolerance) << row.name;
    }
  }
}

}  // namespace
}  // namespace apm
