// Cost of the beat analysis: the spectral front end over a minute of audio,
// and the whole analysis of a three-minute stereo track, stage by stage.
#include <benchmark/benchmark.h>
#include <sys/resource.h>

#include <chrono>
#include <vector>

#include "bench/pulse_track.h"
#include "jni/apm/audio_analyzer.h"

namespace {

constexpr int kRate = kPulseRate;

void BM_SpectrogramAndOnsets60s(benchmark::State& state) {
  const std::vector<int16_t> pcm = PulseTrack(60, 1);
  const std::vector<float> mono(pcm.begin(), pcm.end());
  const apm::ProgressCallback none = [](float) { return false; };
  std::vector<apm::SpectrogramFrame> frames;
  std::vector<float> detection;
  for (auto _ : state) {
    apm::SpectrogramCalculator calculator(0.04f, 0.03f);
    calculator.Initialize(kRate);
    calculator.ComputeSpectrogram(mono, &frames, none);
    apm::OnsetDetector detector;
    detection.clear();
    detector.ComputeDetectionFunction(frames, &detection, none, false);
    benchmark::DoNotOptimize(detection.data());
  }
  state.counters["realtime_x"] = benchmark::Counter(
      60.0 * state.iterations(), benchmark::Counter::kIsRate);
}
BENCHMARK(BM_SpectrogramAndOnsets60s)->Unit(benchmark::kMillisecond);

// One 1025-bin frame of the onset detector, as at 44.1 and 48 kHz.
void BM_OnsetFrame(benchmark::State& state) {
  std::vector<apm::SpectrogramFrame> frames(64, apm::SpectrogramFrame(1025));
  uint32_t noise = 1;
  for (auto& frame : frames) {
    for (auto& bin : frame) {
      noise = noise * 1664525u + 1013904223u;
      bin = {static_cast<float>(noise >> 16) - 32768, static_cast<float>(noise & 0xFFFF) - 32768};
    }
  }
  apm::OnsetDetector detector;
  detector.Reset(1025);
  size_t i = 0;
  for (auto _ : state) {
    benchmark::DoNotOptimize(detector.DetectFrame(frames[i++ % frames.size()].data()));
  }
}
BENCHMARK(BM_OnsetFrame);

// Stage times come from the progress reports: everything up to the first
// report of the tracking stage (mix-down, spectrogram and onsets, which run
// interleaved, then conditioning and the tracker's set-up), and the
// tracker's pass from there to the end.
void BM_WholeAnalysis180sStereo(benchmark::State& state) {
  using Clock = std::chrono::steady_clock;
  const std::vector<int16_t> pcm = PulseTrack(180, 2);
  const auto* bytes = reinterpret_cast<const uint8_t*>(pcm.data());
  const int32_t size = static_cast<int32_t>(pcm.size() * 2);
  double front = 0, tracker = 0, total = 0;
  for (auto _ : state) {
    apm::AudioAnalyzer analyzer(kRate);
    const auto start = Clock::now();
    Clock::time_point tracking_start = start;
    const int32_t beats = analyzer.CalculateBeats(bytes, size, 2, [&](char p) {
      if (p == 66 && tracking_start == start) tracking_start = Clock::now();
      return false;
    });
    const auto end = Clock::now();
    benchmark::DoNotOptimize(beats);
    front += std::chrono::duration<double>(tracking_start - start).count();
    tracker += std::chrono::duration<double>(end - tracking_start).count();
    total += std::chrono::duration<double>(end - start).count();
  }
  const double n = static_cast<double>(state.iterations());
  state.counters["front_end_s"] = front / n;
  state.counters["tracking_s"] = tracker / n;
  state.counters["tracker_share"] = tracker / total;
  state.counters["realtime_x"] = 180.0 * n / total;
  rusage usage;
  getrusage(RUSAGE_SELF, &usage);
  state.counters["peak_rss_mib"] = usage.ru_maxrss / 1024.0;
}
BENCHMARK(BM_WholeAnalysis180sStereo)->Unit(benchmark::kMillisecond)->Iterations(3);

}  // namespace
