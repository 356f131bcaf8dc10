#include "jni/apm/apm.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

namespace apm {

// The tracker's working tables after Run.
class ApmPeer {
 public:
  static const std::vector<double>& Values(const Apm& a) {
    return a.values_.cells;
  }
  static const std::vector<int32_t>& Predecessors(const Apm& a) {
    return a.predecessor_;
  }
  static const std::vector<uint16_t>& BeamStates(const Apm& a) {
    return a.beam_states_.cells;
  }
  static const std::vector<uint16_t>& BeamPredecessors(const Apm& a) {
    return a.beam_predecessors_.cells;
  }
};

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

template <typename T>
bool SameBits(const std::vector<T>& a, const std::vector<T>& b) {
  return a.size() == b.size() &&
         std::memcmp(a.data(), b.data(), a.size() * sizeof(T)) == 0;
}

// The tracking pass as plainly as it can be written: every state scanned
// for orphans, every candidate scored from every beam entry in beam order,
// the beam taken by the heap, a comb ring of the full depth.
struct PlainPass {
  std::vector<double> values;
  std::vector<int32_t> predecessor;
  std::vector<uint16_t> beam_states;
  std::vector<uint16_t> beam_predecessors;
  std::vector<int32_t> path;
};

PlainPass RunPlain(const Apm& a, const ApmConfig& config) {
  constexpr double kImpossible = -100000.0;
  const int T = a.time_count();
  const int V = a.value_count();
  const int N = a.apmtime_count();
  const int S = a.state_count();
  const int B = config.beam_width;
  const int lags = a.lag_count();
  const std::vector<int32_t>& lag = a.state_lag();
  const std::vector<int32_t>& phase = a.state_phase();
  const std::vector<float>& x = a.detection();
  const double w = config.comb_input_weight;
  PlainPass p{std::vector<double>(V * S, kImpossible),
              std::vector<int32_t>(S, -1),
              std::vector<uint16_t>((T + 1) * B, 0),
              std::vector<uint16_t>((T + 1) * B, 0), std::vector<int32_t>(T)};
  std::vector<double> comb(N * lags, kImpossible);
  std::vector<double> observation(S, kImpossible);
  std::vector<int32_t> beam(std::max(B, lags));
  std::copy(a.lag_first_state().begin(), a.lag_first_state().end(),
            beam.begin());
  BeamSelector heap;
  int active = lags;
  for (int t = 0; t < T; ++t) {
    double* cur = &p.values[(t % V) * S];
    double* next = &p.values[((t + 1) % V) * S];
    for (int i = 0; i < lags; ++i) {
      const int back = t - (a.min_lag() + i);
      float product = back >= 0
                          ? x[back] * x[t]
                          : static_cast<float>(config.comb_start_factor * x[t]);
      if (w < 1.0) {
        const float previous =
            static_cast<float>(back >= 0 ? std::exp(comb[(back % N) * lags + i])
                                         : config.comb_start_factor);
        product = static_cast<float>(previous * (1.0 - w) + w * product);
      }
      comb[(t % N) * lags + i] = std::log(product + 1e-5);
    }
    std::vector<char> live(S, 0);
    std::vector<char> on_beat(S, 0);
    for (int i = 0; i < lags; ++i) {
      on_beat[a.lag_first_state()[i] + t % (a.min_lag() + i)] = 1;
    }
    for (int k = 0; t >= 1 && k < active; ++k) {
      if (cur[beam[k]] != kImpossible) live[beam[k]] = 1;
    }
    std::vector<int> candidates;
    for (int s = 0; s < S; ++s) {
      const int from = p.predecessor[s];
      if (on_beat[s] || (t >= 1 && from != -1 && !live[from])) {
        candidates.push_back(s);
      }
    }
    if (next != cur) std::copy_n(cur, S, next);
    for (int c : candidates) next[c] = kImpossible;
    for (int i = 0; i < lags; ++i) {
      observation[a.lag_first_state()[i] + t % (a.min_lag() + i)] =
          comb[(t % N) * lags + i];
    }
    for (int k = 0; k < active; ++k) {
      const int f = beam[k];
      const double vf = cur[f] == kImpossible ? 0.0 : cur[f];
      const int df = WrappedOffset(t, lag[f], phase[f]);
      for (int c : candidates) {
        const int dc = WrappedOffset(t, lag[c], phase[c]);
        const double period = a.period_change_score()[std::min(
            std::abs(lag[c] - lag[f]), config.period_table_size - 1)];
        const double phase_term = a.phase_deviation_score()[std::min(
            std::abs(df - dc), config.phase_table_size - 1)];
        const double score = (config.beat_bonus + vf) +
                             (((observation[c] + period) + phase_term) +
                              a.tempo_prior()[lag[c] - a.min_lag()]);
        if (score > next[c]) {
          next[c] = score;
          p.predecessor[c] = f;
        }
      }
    }
    heap.SelectByHeap(next, S, B, beam.data());
    for (int k = 0; k < B; ++k) {
      const int from = p.predecessor[beam[k]];
      p.beam_states[(t + 1) * B + k] = static_cast<uint16_t>(beam[k]);
      p.beam_predecessors[(t + 1) * B + k] =
          static_cast<uint16_t>(from == -1 ? 0xFFFF : from);
    }
    active = B;
  }
  const double* last = &p.values[(T % V) * S];
  int s = 0;
  double best = -10000000.0;
  for (int i = 0; i < S; ++i) {
    if (last[i] > best) {
      best = last[i];
      s = i;
    }
  }
  for (int t = T; t >= 1; --t) {
    const uint16_t* states = &p.beam_states[t * B];
    int k = 0;
    while (k < B && states[k] != s) ++k;
    if (k == B) {
      k = B - 1;
      if (s == -1) s = states[k];
    }
    p.path[t - 1] = s;
    const uint16_t from = p.beam_predecessors[t * B + k];
    s = from == 0xFFFF ? -1 : from;
  }
  return p;
}

// Every frame's beam and predecessors, the value rows, the predecessors and
// the path, bit for bit, over inputs meant to shake out ties, orphans and
// the fallbacks to scoring one by one.
TEST(ApmRun, SameTablesAsThePlainPass) {
  uint32_t random = 5;
  const auto uniform = [&random] {
    random = random * 1664525u + 1013904223u;
    return static_cast<float>(random >> 8) / (1 << 24);
  };
  const auto noise = [&](int n) {
    std::vector<float> x(n);
    for (float& v : x) v = uniform();
    return x;
  };
  const auto levels = [&](int n) {  // few values, so many equal scores
    std::vector<float> x(n);
    for (float& v : x) v = 0.25f * (1 + static_cast<int>(uniform() * 4));
    return x;
  };
  std::vector<float> peaky = noise(1500);
  for (int t = 0; t < 1500; ++t) {
    peaky[t] *= 0.2f;
    // A tempo that drifts, with missing and extra beats.
    if (t % (45 + t / 300) == 0 && uniform() > 0.1f) peaky[t] = 1.0f;
    if (uniform() > 0.99f) peaky[t] = 0.9f;
  }
  ApmConfig one_row;
  one_row.value_slot_count = 1;
  ApmConfig tiny;
  tiny.min_period_ms = 2.0;
  tiny.max_period_ms = 4.0;
  tiny.beam_width = 9;
  ApmConfig flat;
  flat.use_tempo_prior = false;
  flat.comb_input_weight = 1.0;
  ApmConfig wide;  // long table heads: many near lags, or none grouped
  wide.transition_sigma_ms = 45.0;
  ApmConfig wider;
  wider.transition_sigma_ms = 80.0;
  ApmConfig no_phase;  // NaN phase scores: no score ever wins
  no_phase.phase_deviation_weight = -1.0;
  ApmConfig huge;  // sums that overflow
  huge.beat_bonus = 1e306;
  ApmConfig narrow;
  narrow.beam_width = 3;
  narrow.period_table_size = 1;
  narrow.phase_table_size = 2;
  const std::tuple<std::vector<float>, ApmConfig, int> cases[] = {
      {noise(1200), ApmConfig(), 100},
      {peaky, ApmConfig(), 100},
      {levels(1000), ApmConfig(), 100},
      {std::vector<float>(400, 0.5f), ApmConfig(), 100},
      {{1.0f}, ApmConfig(), 100},
      {{0.3f, 1.0f}, ApmConfig(), 100},
      {noise(7), ApmConfig(), 100},
      {noise(90), ApmConfig(), 100},
      {noise(600), one_row, 100},
      {levels(300), tiny, 1000},
      {noise(500), flat, 100},
      {noise(600), ApmConfig(), 50},
      {levels(250), ApmConfig(), 200},
      {noise(250), wide, 100},
      {noise(250), wider, 100},
      {noise(200), no_phase, 100},
      {noise(200), huge, 100},
      {levels(500), narrow, 100}};
  int index = 0;
  for (const auto& [detection, config, fps] : cases) {
    const Tracked r = Track(detection, config, fps);
    const Apm& a = *r.tracker;
    const PlainPass plain = RunPlain(a, config);
    EXPECT_TRUE(SameBits(ApmPeer::BeamStates(a), plain.beam_states)) << index;
    EXPECT_TRUE(SameBits(ApmPeer::BeamPredecessors(a), plain.beam_predecessors))
        << index;
    EXPECT_TRUE(SameBits(ApmPeer::Values(a), plain.values)) << index;
    EXPECT_TRUE(SameBits(ApmPeer::Predecessors(a), plain.predecessor)) << index;
    EXPECT_EQ(a.path(), plain.path) << index;
    ++index;
  }
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
