// Resampling throughput, 44.1 kHz to 48 kHz, in output frames per second;
// libsamplerate's linear converter and speexdsp at quality 0 run beside ours
// when installed.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <memory>
#include <random>
#include <vector>

#include "resampler/audio_resampler.h"

#ifdef CLIPWEAVER_BENCH_SAMPLERATE
#include <samplerate.h>
#endif
#ifdef CLIPWEAVER_BENCH_SPEEXDSP
#include <speex/speex_resampler.h>
#endif

namespace {

constexpr int kInputRate = 44100;
constexpr int kOutputRate = 48000;
// 10 ms blocks, the size the app hands over.
constexpr int kInputFrames = 441;

std::vector<int16_t> Noise(size_t samples) {
  std::mt19937 random(3);
  std::uniform_int_distribution<int> value(-20000, 20000);
  std::vector<int16_t> noise(samples);
  for (int16_t& s : noise) s = static_cast<int16_t>(value(random));
  return noise;
}

void ReportFrames(benchmark::State& state, int64_t frames) {
  state.counters["frames/s"] = benchmark::Counter(static_cast<double>(frames),
                                                  benchmark::Counter::kIsRate);
}

void BM_LinearResampler(benchmark::State& state) {
  const int channels = static_cast<int>(state.range(0));
  const bool stereoOutput = state.range(1) != 0;
  std::unique_ptr<norvane::AudioResampler> resampler(norvane::AudioResampler::create(
      16, channels, kOutputRate, norvane::AudioResampler::QUALITY_LOW, stereoOutput));
  resampler->setSourceSampleRate(kInputRate);
  resampler->setVolume(1.0f, 0.5f);
  const std::vector<int16_t> input = Noise(kInputFrames * channels);
  std::vector<int16_t> output(2 * kInputFrames * 2);
  const int outputChannels = channels == 2 || stereoOutput ? 2 : 1;
  int64_t frames = 0;
  for (auto _ : state) {
    resampler->resample(output.data(), input.data(), kInputFrames);
    benchmark::ClobberMemory();
    frames += static_cast<int64_t>(resampler->getOutputSampleCount(kInputFrames)) / outputChannels;
  }
  ReportFrames(state, frames);
}
BENCHMARK(BM_LinearResampler)
    ->ArgNames({"channels", "stereo_out"})
    ->Args({1, 0})
    ->Args({1, 1})
    ->Args({2, 0});

#ifdef CLIPWEAVER_BENCH_SAMPLERATE
// Float data, its native format.
void BM_SamplerateLinear(benchmark::State& state) {
  const int channels = static_cast<int>(state.range(0));
  int error = 0;
  SRC_STATE* converter = src_new(SRC_LINEAR, channels, &error);
  std::vector<float> input(kInputFrames * channels);
  const std::vector<int16_t> noise = Noise(input.size());
  src_short_to_float_array(noise.data(), input.data(), static_cast<int>(input.size()));
  std::vector<float> output(2 * kInputFrames * channels);
  SRC_DATA data = {};
  data.data_in = input.data();
  data.data_out = output.data();
  data.input_frames = kInputFrames;
  data.output_frames = 2 * kInputFrames;
  data.src_ratio = static_cast<double>(kOutputRate) / kInputRate;
  int64_t frames = 0;
  for (auto _ : state) {
    src_process(converter, &data);
    benchmark::ClobberMemory();
    frames += data.output_frames_gen;
  }
  ReportFrames(state, frames);
  src_delete(converter);
}
BENCHMARK(BM_SamplerateLinear)->ArgName("channels")->Arg(1)->Arg(2);
#endif

#ifdef CLIPWEAVER_BENCH_SPEEXDSP
void BM_SpeexQuality0(benchmark::State& state) {
  const int channels = static_cast<int>(state.range(0));
  int error = 0;
  SpeexResamplerState* resampler =
      speex_resampler_init(channels, kInputRate, kOutputRate, 0, &error);
  const std::vector<int16_t> input = Noise(kInputFrames * channels);
  std::vector<int16_t> output(2 * kInputFrames * channels);
  int64_t frames = 0;
  for (auto _ : state) {
    spx_uint32_t inputFrames = kInputFrames;
    spx_uint32_t outputFrames = 2 * kInputFrames;
    speex_resampler_process_interleaved_int(resampler, input.data(), &inputFrames,
                                            output.data(), &outputFrames);
    benchmark::ClobberMemory();
    frames += outputFrames;
  }
  ReportFrames(state, frames);
  speex_resampler_destroy(resampler);
}
BENCHMARK(BM_SpeexQuality0)->ArgName("channels")->Arg(1)->Arg(2);
#endif

}  // namespace
