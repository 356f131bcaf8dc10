#include "jni/apm/apm.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "jni/apm/tempo_model.h"

namespace apm {
namespace {

using testing::internal::CaptureStderr;
using testing::internal::GetCapturedStderr;

// Peaks of 1 at first, first + spacing, ... and 0.01 elsewhere.
std::vector<float> Peaks(int frames, int first, int spacing) {
  std::vector<float> x(frames, 0.01f);
  for (int t = first; t < frames; t += spacing) x[t] = 1.0f;
  return x;
}

struct Tracked {
  std::unique_ptr<Apm> tracker;
  std::string log;
};

// Builds and, unless told otherwise, runs a tracker, keeping its log.
Tracked Track(const std::vector<float>& detection,
              const ApmConfig& config = ApmConfig(), int fps = 100,
              bool run = true) {
  CaptureStderr();
  auto tracker = std::make_unique<Apm>(config, detection, fps);
  if (run) tracker->Run([](float) { return false; });
  return {std::move(tracker), GetCapturedStderr()};
}

// The default set-up with one field changed.
template <typename T>
ApmConfig With(T ApmConfig::*field, T value) {
  ApmConfig config;
  config.*field = value;
  return config;
}

bool Logged(const Tracked& result, const std::string& line) {
  return result.log.find("native : apm.cc:" + line + "\n") != std::string::npos;
}

// Log lines of the trim and of the model, and how many lines in all.
TEST(ApmModel, TrimGridAndModelLog) {
  std::vector<float> weak(300, 0.01f);
  weak[7] = 0.02f;
  const struct {
    std::vector<float> detection;
    int fps, lines;
    std::vector<const char*> logged;
  } rows[] = {
      {Peaks(2500, 0, 50), 100, 1 + 76 + 8,
       {"69 Input trimmed 0 leading points and 49 trailing points to size 2451 in msec 24510",
        "151 Lag 0 msec:50 bpm:1200", "151 Lag 75 msec:800 bpm:75", "154 delta_pd_ms 10",
        "155 minlag 5", "156 maxlag 80", "157 lag count 76", "158 time count 2451",
        "159 state count 3230", "160 value count 3", "161 apmtime count 2000"}},
      // The float nearest 0.05 lies above the double 0.05 and so stays.
      {{0.01f, 0.2f, 0.04f, 1.0f, 0.05f, 0.0f}, 100, 85,
       {"69 Input trimmed 1 leading points and 1 trailing points to size 4 in msec 40"}},
      {weak, 100, 86,
       {"60 Unable to trim detection function.",
        "69 Input trimmed 0 leading points and 0 trailing points to size 300 in msec 3000"}},
      // 12.5 frames round away from zero; one frame needs two value rows.
      {{1.0f}, 250, 197, {"155 minlag 13", "160 value count 2", "161 apmtime count 1"}},
      {{1.0f}, 17, 23, {"159 state count 105"}},
      // A shortest period of one frame is usable.
      {{1.0f}, 20, 25, {"159 state count 136"}}};
  for (const auto& row : rows) {
    const Tracked r = Track(row.detection, ApmConfig(), row.fps, false);
    EXPECT_EQ(std::count(r.log.begin(), r.log.end(), '\n'), row.lines) << row.logged[0];
    for (const char* line : row.logged) EXPECT_TRUE(Logged(r, line)) << line;
  }
}

TEST(ApmModel, ScoreTablesAndTempoPrior) {
  const std::vector<double> phase = TransitionScores(100, 0.9, 10.0, 5.0);
  const std::vector<double> period = TransitionScores(100, 0.5, 10.0, 5.0);
  const double expected[][2] = {{-0.1053494, -0.6931272},
                                {-2.1052784, -2.6929994},
                                {-8.0727755, -8.6352376}};
  for (int d = 0; d < 3; ++d) {
    EXPECT_NEAR(phase[d], expected[d][0], 5e-8) << d;
    EXPECT_NEAR(period[d], expected[d][1], 5e-8) << d;
  }
  EXPECT_NEAR(phase[3], -11.5116, 5e-5);
  EXPECT_EQ(period[99], std::log(1e-5));

  std::vector<int32_t> lags;
  for (int lag = 5; lag <= 80; ++lag) lags.push_back(lag);
  const std::vector<double> prior = TempoPrior(lags, 100, 500.0, 0.2, 2.0);
  const std::pair<int, double> priors[] = {{5, -22.392342}, {10, -12.205017},
                                           {25, -2.265414}, {40, -0.234766},
                                           {50, 0.00002},   {80, -1.041591}};
  for (const auto& [lag, value] : priors) {
    EXPECT_NEAR(prior[lag - 5], value, 5e-7) << lag;
  }
}

TEST(ApmPlacement, WrappedOffsetsBeatsAndTempo) {
  for (const auto& [lag, expected] :
       {std::pair<int, std::vector<int>>{4, {1, 2, -1, 0, 1, 2, -1}},
        {5, {1, 2, -2, -1, 0, 1, 2, -2, -1}}}) {
    std::vector<int> offsets;  // for x = (t mod lag) - phase from -(lag - 1)
    for (int x = 1 - lag; x < lag; ++x) {
      offsets.push_back(WrappedOffset(std::max(x, 0), lag, std::max(-x, 0)));
    }
    EXPECT_EQ(offsets, expected) << lag;
  }

  const std::vector<int32_t> frames =
      PlaceBeatFrames(std::vector<int32_t>(200, 0), {50}, {10}, 0.75);
  EXPECT_EQ(frames, (std::vector<int32_t>{0, 60, 110, 160}));
  const std::vector<double> times = BeatFramesToSeconds(frames, 0, 100);
  EXPECT_EQ(times, (std::vector<double>{0.0, 0.6, 1.1, 1.6}));
  EXPECT_EQ(MedianTempo(times), 119.99999999999997);
  EXPECT_EQ(MedianTempo(BeatFramesToSeconds(frames, 12, 100)), 120.0);
  // Lag 40: phase 0, then phase 5 from frame 75 (a beat there although off
  // the new phase), or from frame 50 (too close to the beat at 40).
  for (const auto& [change, expected] :
       {std::pair<int, std::vector<int32_t>>{75, {0, 40, 75, 125}},
        {50, {0, 40, 85, 125}}}) {
    std::vector<int32_t> path(150, 0);
    std::fill(path.begin() + change, path.end(), 1);
    EXPECT_EQ(PlaceBeatFrames(path, {40, 40}, {0, 5}, 0.75), expected);
  }
  EXPECT_EQ(MedianTempo({0.0, 0.5, 1.5, 3.5, 6.5}), 30.0);  // upper middle
  EXPECT_EQ(MedianTempo({2.0}), 0.0);
}

TEST(ApmRun, FollowsPeaksAndThePullOfTheTempoPrior) {
  // Peaks 25 frames apart: every second one, nearer the prior's centre.
  for (const auto& [spacing, beat_spacing, count, prior] :
       {std::tuple<int, int, size_t, bool>{60, 60, 20, true}, {25, 50, 24, true},
        {60, 60, 20, false}}) {
    const Tracked r = Track(Peaks(1200, 30, spacing), With(&ApmConfig::use_tempo_prior, prior));
    const std::vector<double> times = r.tracker->beat_times();
    ASSERT_EQ(times.size(), count) << spacing;
    for (size_t i = 0; i < times.size(); ++i) {
      EXPECT_DOUBLE_EQ(times[i], (30.0 + beat_spacing * i) / 100) << spacing;
    }
    EXPECT_NEAR(r.tracker->bpm(), 6000.0 / beat_spacing, 1e-9);
  }
  const Tracked one = Track({0.0f, 0.0f, 1.0f});
  EXPECT_EQ(one.tracker->beat_times(), std::vector<double>{0.02});
  EXPECT_EQ(one.tracker->bpm(), 0.0);
}

TEST(ApmRun, ProgressEvery500FramesAndCancellation) {
  std::vector<float> seen;
  Tracked r = Track(Peaks(1200, 30, 50), ApmConfig(), 100, false);
  CaptureStderr();
  r.tracker->Run([&seen](float p) {
    seen.push_back(p);
    return p > 0.5f;
  });
  r.log = GetCapturedStderr();
  EXPECT_EQ(seen, (std::vector<float>{0.0f, 500.0f / 1151, 1000.0f / 1151}));
  EXPECT_TRUE(Logged(r, "280 Timestep 1000 10 sec"));
  EXPECT_TRUE(r.tracker->beat_times().empty());
  EXPECT_EQ(r.tracker->bpm(), 0.0);
}

// The fast paths (grouped scoring, incremental beam selection, partial row
// copies, dropping decided beam rows) against the plain search: the same
// beats and the same log, broken links included, over inputs meant to shake
// out ties, orphans, the fallbacks and late merges. What the two share is
// held by the beat counts, as the search found them.
TEST(ApmRun, FastPathsMatchThePlainSearch) {
  uint32_t random = 5;
  const auto uniform = [&random] {
    random = random * 1664525u + 1013904223u;
    return static_cast<float>(random >> 8) / (1 << 24);
  };
  // Uniform noise, or four levels of it: many equal scores.
  const auto noise = [&](int n, bool levels = false) {
    std::vector<float> x(n);
    for (float& v : x) v = levels ? 0.25f * (1 + static_cast<int>(uniform() * 4)) : uniform();
    return x;
  };
  // A drifting tempo with missing and extra beats, a change of tempo, and
  // gaps of near-silence.
  std::vector<float> music = noise(12000);
  for (int t = 0; t < 12000; ++t) {
    music[t] *= 0.2f;
    const int period = t < 6000 ? 45 + t / 300 : 38;
    if (t % period == 0 && uniform() > 0.1f) music[t] = 1.0f;
    if (uniform() > 0.99f) music[t] = 0.9f;
    if (t % 4000 > 3000) music[t] *= 0.01f;
  }
  ApmConfig tiny;  // all nine states fit the beam: broken links
  tiny.min_period_ms = 2.0;
  tiny.max_period_ms = 4.0;
  tiny.beam_width = 9;
  ApmConfig flat;
  flat.use_tempo_prior = false;
  flat.comb_input_weight = 1.0;
  ApmConfig narrow;
  narrow.beam_width = 3;
  narrow.period_table_size = 1;
  narrow.phase_table_size = 2;
  const std::tuple<std::vector<float>, ApmConfig, int, size_t> cases[] = {
      {music, ApmConfig(), 100, 226},
      {noise(3000), ApmConfig(), 100, 63},
      {noise(1000, true), ApmConfig(), 100, 23},
      {std::vector<float>(400, 0.5f), ApmConfig(), 100, 10},
      {{0.3f, 1.0f}, ApmConfig(), 100, 1},
      {noise(90), ApmConfig(), 100, 3},
      {noise(600), With(&ApmConfig::value_slot_count, 1), 100, 14},
      {noise(3000, true), tiny, 1000, 750},
      {noise(500), flat, 100, 96},
      {noise(250, true), ApmConfig(), 200, 3},
      // Long table heads: many near lags, or none grouped.
      {noise(250), With(&ApmConfig::transition_sigma_ms, 45.0), 100, 7},
      {noise(250), With(&ApmConfig::transition_sigma_ms, 80.0), 100, 7},
      // NaN phase scores, so no score ever wins; sums that overflow.
      {noise(200), With(&ApmConfig::phase_deviation_weight, -1.0), 100, 5},
      {noise(200), With(&ApmConfig::beat_bonus, 1e306), 100, 42},
      {noise(1500, true), narrow, 100, 33}};
  int index = 0;
  for (const auto& [detection, config, fps, beats] : cases) {
    ApmConfig plain = config;
    plain.plain_search = true;
    const Tracked fast = Track(detection, config, fps);
    const Tracked reference = Track(detection, plain, fps);
    EXPECT_EQ(fast.tracker->beat_times(), reference.tracker->beat_times()) << index;
    EXPECT_EQ(fast.log, reference.log) << index;
    EXPECT_EQ(reference.tracker->beat_times().size(), beats) << index;
    ++index;
  }
}

// One ERROR line of the tracker's own, no model, no progress, no beats.
TEST(ApmRun, UnusableInputOrSetUp) {
  ApmConfig two_lags;  // a grid needs three
  two_lags.max_period_ms = 60.0;
  two_lags.beam_width = 3;
  const std::vector<float> peaks = Peaks(500, 0, 50);
  const std::tuple<std::vector<float>, ApmConfig, int> cases[] = {
      {{}, ApmConfig(), 100},
      {std::vector<float>(500, 0.0f), ApmConfig(), 100},
      {{0.5f, INFINITY}, ApmConfig(), 100},
      {{0.5f, NAN, 1.0f}, ApmConfig(), 100},
      {peaks, ApmConfig(), 0},     // no frame rate
      {peaks, ApmConfig(), 5},     // shortest lag under a frame
      {peaks, ApmConfig(), 16},    // 91 states for a beam of 100
      {peaks, ApmConfig(), 1000},  // too many states for 16 bits
      {peaks, With(&ApmConfig::max_period_ms, 50.0), 100},  // one lag
      {peaks, With(&ApmConfig::beam_width, 3231), 100},
      {peaks, With(&ApmConfig::phase_table_size, 0), 100},
      {peaks, two_lags, 100}};
  int index = 0;
  for (const auto& [detection, config, fps] : cases) {
    Tracked r = Track(detection, config, fps, false);
    int calls = 0;
    r.tracker->Run([&calls](float) { return ++calls < 0; });
    EXPECT_EQ(calls, 0) << index;
    EXPECT_TRUE(r.tracker->beat_times().empty()) << index;
    EXPECT_EQ(r.log.find("no beats to track"), r.log.size() - 19) << index;  // once, last
    EXPECT_EQ(r.log.find("Lag "), std::string::npos) << index;
    ++index;
  }
}

}  // namespace
}  // namespace apm
