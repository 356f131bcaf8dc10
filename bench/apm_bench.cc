// Cost of the tempo and beat tracker on three minutes of detection function
// at 100 frames per second: construction, the beam search and placement.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <vector>

#include "jni/apm/apm.h"

namespace {

constexpr int kFrames = 18000;

// A conditioned-looking function: kicks every 50 frames, weaker off-beats
// and a low pseudo-random floor.
std::vector<float> DetectionFunction() {
  std::vector<float> x(kFrames);
  uint32_t noise = 7;
  for (int t = 0; t < kFrames; ++t) {
    noise = noise * 1664525u + 1013904223u;
    const float level = static_cast<float>(noise >> 8) / (1 << 24) * 0.15f;
    x[t] = t % 50 == 0 ? 1.0f : t % 25 == 0 ? 0.5f : level;
  }
  return x;
}

void BM_TrackThreeMinutes(benchmark::State& state) {
  const std::vector<float> detection = DetectionFunction();
  // The tracker logs its model and progress; keep the benchmark output
  // readable.
  const int saved = dup(2);
  const int null = open("/dev/null", O_WRONLY);
  dup2(null, 2);
  size_t beats = 0;
  for (auto _ : state) {
    apm::Apm tracker(apm::ApmConfig(), detection, 100);
    tracker.Run([](float) { return false; });
    beats = tracker.beat_times().size();
  }
  dup2(saved, 2);
  close(null);
  close(saved);
  state.SetItemsProcessed(state.iterations() * kFrames);
  state.counters["per_frame"] = benchmark::Counter(
      kFrames, benchmark::Counter::kIsIterationInvariantRate |
                   benchmark::Counter::kInvert);
  state.counters["beats"] = static_cast<double>(beats);
}
BENCHMARK(BM_TrackThreeMinutes)->Unit(benchmark::kMillisecond);

}  // namespace
