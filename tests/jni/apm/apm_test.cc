#include "jni/apm/apm.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

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

bool Logged(const Tracked& result, const std::string& line) {
  return result.log.find("native : apm.cc:" + line + "\n") != std::string::npos;
}

int Count(const std::string& text, const std::string& part) {
  int count = 0;
  for (size_t at = text.find(part); at != std::string::npos;
       at = text.find(part, at + 1)) {
    ++count;
  }
  return count;
}

TEST(ApmTrim, CutsWeakEndsThenNormalisesAndShapes) {
  const Tracked r = Track({0.01f, 0.2f, 0.04f, 1.0f, 0.05f, 0.0f, 0.0f},
                          ApmConfig(), 100, false);
  EXPECT_EQ(r.tracker->leading_trimmed(), 1);
  EXPECT_EQ(r.tracker->trailing_trimmed(), 2);
  const std::vector<float>& x = r.tracker->detection();
  ASSERT_EQ(x.size(), 4u);
  EXPECT_FLOAT_EQ(x[0], std::sqrt(0.2f));
  EXPECT_FLOAT_EQ(x[1], std::sqrt(0.04f));
  EXPECT_EQ(x[2], 1.0f);
  // The float nearest 0.05 lies above the double 0.05 and so stays.
  EXPECT_FLOAT_EQ(x[3], std::sqrt(0.05f));

  ApmConfig config;
  config.trim_threshold = 0.5;
  config.detection_exponent = 1.0;
  const Tracked equal = Track({0.4f, 0.5f, 2.0f, 0.49f}, config, 100, false);
  EXPECT_EQ(equal.tracker->detection(), (std::vector<float>{0.25f, 1.0f}));

  std::vector<float> weak(300, 0.01f);
  weak[7] = 0.02f;
  const Tracked all = Track(weak, ApmConfig(), 100, false);
  EXPECT_EQ(all.tracker->leading_trimmed() + all.tracker->trailing_trimmed(),
            0);
  EXPECT_FLOAT_EQ(all.tracker->detection()[7], 1.0f);
  EXPECT_EQ(
      all.log.find("native : apm.cc:60 Unable to trim detection function.\n"
                   "native : apm.cc:69 Input trimmed 0 leading points and "
                   "0 trailing points to size 300 in msec 3000\n"),
      0u);
}

TEST(ApmModel, GridSizesAndModelLog) {
  const Tracked r = Track(Peaks(2500, 0, 50), ApmConfig(), 100, false);
  const Apm& a = *r.tracker;
  EXPECT_EQ(a.lag_ms().front(), 50.0);
  EXPECT_EQ(a.lag_ms().back(), 800.0);
  EXPECT_EQ(a.lag_first_state()[1], 5);
  EXPECT_EQ(a.lag_first_state()[75], 3230 - 80);
  EXPECT_EQ(a.state_lag()[5], 6);
  EXPECT_EQ(a.state_phase()[5], 0);
  EXPECT_EQ(a.state_lag().back(), 80);
  EXPECT_EQ(a.state_phase().back(), 79);
  for (const char* line :
       {"151 Lag 0 msec:50 bpm:1200", "151 Lag 75 msec:800 bpm:75",
        "154 delta_pd_ms 10", "155 minlag 5", "156 maxlag 80",
        "157 lag count 76", "158 time count 2451", "159 state count 3230",
        "160 value count 3", "161 apmtime count 2000"}) {
    EXPECT_TRUE(Logged(r, line)) << line;
  }
  EXPECT_EQ(Count(r.log, "\n"), 1 + 76 + 8);

  const Tracked one = Track({1.0f}, ApmConfig(), 100, false);
  EXPECT_EQ(one.tracker->value_count(), 2);
  EXPECT_EQ(one.tracker->apmtime_count(), 1);
  // 12.5 frames round away from zero.
  EXPECT_EQ(Track({1.0f}, ApmConfig(), 250, false).tracker->min_lag(), 13);
  EXPECT_EQ(Track({1.0f}, ApmConfig(), 17, false).tracker->state_count(), 105);
}

TEST(ApmModel, ScoreTablesAndTempoPrior) {
  const Tracked r = Track({1.0f}, ApmConfig(), 100, false);
  const std::vector<double>& phase = r.tracker->phase_deviation_score();
  const std::vector<double>& period = r.tracker->period_change_score();
  ASSERT_EQ(phase.size(), 100u);
  ASSERT_EQ(period.size(), 100u);
  const double expected[][2] = {{-0.1053494, -0.6931272},
                                {-2.1052784, -2.6929994},
                                {-8.0727755, -8.6352376}};
  for (int d = 0; d < 3; ++d) {
    EXPECT_NEAR(phase[d], expected[d][0], 5e-8) << d;
    EXPECT_NEAR(period[d], expected[d][1], 5e-8) << d;
  }
  EXPECT_NEAR(phase[3], -11.5116, 5e-5);
  EXPECT_NEAR(period[3], -11.5122, 5e-5);
  EXPECT_NEAR(period[99], std::log(1e-5), 1e-12);

  const std::vector<double>& prior = r.tracker->tempo_prior();
  const std::pair<int, double> priors[] = {{5, -22.392342}, {10, -12.205017},
                                           {25, -2.265414}, {40, -0.234766},
                                           {50, 0.00002},   {80, -1.041591}};
  for (const auto& [lag, value] : priors) {
    EXPECT_NEAR(prior[lag - 5], value, 5e-7) << lag;
  }
  ApmConfig flat;
  flat.use_tempo_prior = false;
  EXPECT_EQ(Track({1.0f}, flat, 100, false).tracker->tempo_prior(),
            std::vector<double>(76, 0.0));
}

TEST(ApmTracking, WrappedOffsetIsTheSignedDistanceToTheNearestBeat) {
  for (const auto& [lag, expected] :
       {std::pair<int, std::vector<int>>{4, {1, 2, -1, 0, 1, 2, -1}},
        {5, {1, 2, -2, -1, 0, 1, 2, -2, -1}}}) {
    std::vector<int> offsets;  // for x = (t mod lag) - phase from -(lag - 1)
    for (int x = 1 - lag; x < lag; ++x) {
      offsets.push_back(WrappedOffset(std::max(x, 0), lag, std::max(-x, 0)));
    }
    EXPECT_EQ(offsets, expected) << lag;
  }
}

TEST(ApmBeam, HeapOrderForEqualValuesAndFullHeaps) {
  BeamSelector selector;
  const double equal[] = {0, 0, 0, 0, 0};
  std::vector<int32_t> beam(5);
  selector.Select(equal, 4, 4, beam.data());
  EXPECT_EQ(beam, (std::vector<int32_t>{0, 1, 3, 2, 0}));
  selector.Select(equal, 5, 5, beam.data());
  EXPECT_EQ(beam, (std::vector<int32_t>{0, 1, 3, 4, 2}));
  // Full: a value must exceed the root to get in; the two 5s tie.
  const double values[] = {3, 1, 4, 1, 5, 9, 2, 6, 5, 3};
  selector.Select(values, 10, 3, beam.data());
  EXPECT_EQ(beam, (std::vector<int32_t>{4, 7, 5, 4, 2}));
}

// Rows drifting from frame to frame like the tracker's, now and then with
// a tie near the edge of the beam: the shortcut must match the heap.
TEST(ApmBeam, ShortcutAgreesWithTheHeap) {
  constexpr int kCount = 400;
  constexpr int kWidth = 30;
  uint32_t random = 99;
  const auto next = [&random] {
    return (random = random * 1664525u + 1013904223u) >> 8;
  };
  std::vector<double> row(kCount);
  for (double& v : row) v = next() % 100000;
  BeamSelector fast;
  BeamSelector heap;
  std::vector<int32_t> a(kWidth);
  std::vector<int32_t> b(kWidth);
  int differing = 0;
  for (int frame = 0; frame < 3000; ++frame) {
    for (int i = 0; i < 20; ++i) row[next() % kCount] += next() % 2000 - 1000.0;
    if (frame % 7 == 0) {
      std::vector<double> sorted = row;
      std::sort(sorted.begin(), sorted.end());
      row[next() % kCount] = sorted[kCount - kWidth - 2 + next() % 4];
    }
    fast.Select(row.data(), kCount, kWidth, a.data());
    heap.SelectByHeap(row.data(), kCount, kWidth, b.data());
    differing += a != b;
  }
  EXPECT_EQ(differing, 0);
}

TEST(ApmPlacement, BeatsOnTheBeatOrAtChangesAfterTheSpacing) {
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
  EXPECT_EQ(MedianTempo({1.0, 1.5}), 120.0);
  EXPECT_EQ(MedianTempo({0.0, 0.5, 1.5, 3.5, 6.5}), 30.0);  // upper middle
  EXPECT_EQ(MedianTempo({2.0}), 0.0);
}

TEST(ApmRun, FollowsPeaksAndThePullOfTheTempoPrior) {
  // Peaks 25 frames apart: every second one, nearer the prior's centre.
  for (const auto& [spacing, beat_spacing, count] :
       {std::tuple<int, int, size_t>{50, 50, 24}, {60, 60, 20}, {25, 50, 24}}) {
    const Tracked r = Track(Peaks(1200, 30, spacing));
    const std::vector<double> times = r.tracker->beat_times();
    ASSERT_EQ(times.size(), count) << spacing;
    for (size_t i = 0; i < times.size(); ++i) {
      EXPECT_DOUBLE_EQ(times[i], (30.0 + beat_spacing * i) / 100) << spacing;
    }
    EXPECT_NEAR(r.tracker->bpm(), 6000.0 / beat_spacing, 1e-9);
    EXPECT_EQ(Count(r.log, "Broken state link"), 0);
  }
}

TEST(ApmRun, ProgressEvery500FramesAndCancellation) {
  std::vector<float> seen;
  Tracked r = Track(Peaks(1200, 30, 50), ApmConfig(), 100, false);
  EXPECT_TRUE(Logged(r,
                     "69 Input trimmed 30 leading points and 19 trailing "
                     "points to size 1151 in msec 11510"));
  CaptureStderr();
  r.tracker->Run([&seen](float p) {
    seen.push_back(p);
    return p > 0.5f;
  });
  r.log = GetCapturedStderr();
  EXPECT_EQ(seen, (std::vector<float>{0.0f, 500.0f / 1151, 1000.0f / 1151}));
  EXPECT_TRUE(Logged(r, "280 Timestep 1000 10 sec"));
  EXPECT_TRUE(r.tracker->beat_times().empty());

  r = Track(Peaks(1200, 30, 50), ApmConfig(), 100, false);
  CaptureStderr();
  r.tracker->Run([](float) { return true; });
  r.log = GetCapturedStderr();
  EXPECT_EQ(r.log, "native : apm.cc:280 Timestep 0 0 sec\n");
  EXPECT_TRUE(r.tracker->beat_times().empty());
  EXPECT_EQ(r.tracker->bpm(), 0.0);
}

TEST(ApmRun, BrokenLinkAndSingleFrame) {
  // All nine states fit the beam, so the second frame can start paths from
  // states the first frame never reached.
  ApmConfig tiny;
  tiny.min_period_ms = 2.0;
  tiny.max_period_ms = 4.0;
  tiny.beam_width = 9;
  std::vector<float> x(20, 0.1f);
  x[0] = 1.0f;
  const Tracked r = Track(x, tiny, 1000);
  EXPECT_TRUE(Logged(r, "397 Broken state link 2 of 20"));
  for (int32_t s : r.tracker->path()) EXPECT_TRUE(s >= 0 && s < 9) << s;
  EXPECT_FALSE(r.tracker->beat_times().empty());

  const Tracked one = Track({0.0f, 0.0f, 1.0f});
  EXPECT_EQ(one.tracker->beat_times(), std::vector<double>{0.02});
  EXPECT_EQ(one.tracker->bpm(), 0.0);
}

// One ERROR line of the tracker's own, no model, no progress, no beats.
TEST(ApmRun, UnusableInputOrSetUp) {
  ApmConfig one_lag;
  one_lag.max_period_ms = 50.0;
  ApmConfig wide_beam;
  wide_beam.beam_width = 3231;
  ApmConfig no_table;
  no_table.phase_table_size = 0;
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
      {peaks, one_lag, 100},
      {peaks, wide_beam, 100},
      {peaks, no_table, 100}};
  int index = 0;
  for (const auto& [detection, config, fps] : cases) {
    Tracked r = Track(detection, config, fps, false);
    int calls = 0;
    r.tracker->Run([&calls](float) { return ++calls < 0; });
    EXPECT_EQ(calls, 0) << index;
    EXPECT_TRUE(r.tracker->beat_times().empty()) << index;
    EXPECT_EQ(r.tracker->bpm(), 0.0) << index;
    EXPECT_EQ(Count(r.log, "no beats to track"), 1) << index;
    EXPECT_EQ(Count(r.log, "Lag "), 0) << index;
    ++index;
  }
}

}  // namespace
}  // namespace apm
