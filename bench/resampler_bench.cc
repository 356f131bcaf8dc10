// Resampling throughput, 44.1 kHz to 48 kHz, in output frames per second;
// libsamplerate's linear converter and speexdsp at quality 0 run beside ours
// when installed.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <memory>
#include <random>
#include <vector>

#include "bench/alternating_batches.h"
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

// Each converter takes one block per Run() and returns the output frames
// it made.
class OurResampler {
 public:
  OurResampler(int channels, bool stereo_output)
      : resampler_(norvane::AudioResampler::create(
            16, channels, kOutputRate, norvane::AudioResampler::QUALITY_LOW, stereo_output)),
        input_(Noise(kInputFrames * channels)),
        output_(2 * kInputFrames * 2),
        output_channels_(channels == 2 || stereo_output ? 2 : 1) {
    resampler_->setSourceSampleRate(kInputRate);
    resampler_->setVolume(1.0f, 0.5f);
  }
  int64_t Run() {
    resampler_->resample(output_.data(), input_.data(), kInputFrames);
    benchmark::ClobberMemory();
    return resampler_->getOutputSampleCount(kInputFrames) / output_channels_;
  }

 private:
  std::unique_ptr<norvane::AudioResampler> resampler_;
  std::vector<int16_t> input_;
  std::vector<int16_t> output_;
  int output_channels_;
};

template <typename Converter>
void MeasureFrames(benchmark::State& state, Converter* converter) {
  int64_t frames = 0;
  for (auto _ : state) frames += converter->Run();
  state.counters["frames/s"] =
      benchmark::Counter(static_cast<double>(frames), benchmark::Counter::kIsRate);
}

void BM_LinearResampler(benchmark::State& state) {
  OurResampler ours(static_cast<int>(state.range(0)), state.range(1) != 0);
  MeasureFrames(state, &ours);
}
BENCHMARK(BM_LinearResampler)
    ->ArgNames({"channels", "stereo_out"})
    ->Args({1, 0})
    ->Args({1, 1})
    ->Args({2, 0});

// Ours and a reference in alternating batches (alternating_batches.h): the
// ratio of their speeds.
template <typename Reference>
void MeasureSpeedup(benchmark::State& state) {
  const int channels = static_cast<int>(state.range(0));
  OurResampler ours(channels, false);
  Reference reference(channels);
  int64_t our_frames = 0, reference_frames = 0;
  const BatchSeconds seconds = TimeInAlternatingBatches(
      state, 64, [&] { our_frames += ours.Run(); },
      [&] { reference_frames += reference.Run(); });
  state.counters["speedup"] =
      (our_frames / seconds.first) / (reference_frames / seconds.second);
}

#ifdef CLIPWEAVER_BENCH_SAMPLERATE
// Float data, its native format.
class SamplerateLinear {
 public:
  explicit SamplerateLinear(int channels)
      : input_(kInputFrames * channels), output_(2 * kInputFrames * channels) {
    int error = 0;
    converter_ = src_new(SRC_LINEAR, channels, &error);
    const std::vector<int16_t> noise = Noise(input_.size());
    src_short_to_float_array(noise.data(), input_.data(), static_cast<int>(input_.size()));
    data_.data_in = input_.data();
    data_.data_out = output_.data();
    data_.input_frames = kInputFrames;
    data_.output_frames = 2 * kInputFrames;
    data_.src_ratio = static_cast<double>(kOutputRate) / kInputRate;
  }
  ~SamplerateLinear() { src_delete(converter_); }
  int64_t Run() {
    src_process(converter_, &data_);
    benchmark::ClobberMemory();
    return data_.output_frames_gen;
  }

 private:
  std::vector<float> input_;
  std::vector<float> output_;
  SRC_STATE* converter_;
  SRC_DATA data_ = {};
};

void BM_SamplerateLinear(benchmark::State& state) {
  SamplerateLinear reference(static_cast<int>(state.range(0)));
  MeasureFrames(state, &reference);
}
BENCHMARK(BM_SamplerateLinear)->ArgName("channels")->Arg(1)->Arg(2);
void BM_SpeedupOverSamplerate(benchmark::State& state) { MeasureSpeedup<SamplerateLinear>(state); }
BENCHMARK(BM_SpeedupOverSamplerate)->ArgName("channels")->Arg(1)->Arg(2);
#endif

#ifdef CLIPWEAVER_BENCH_SPEEXDSP
class SpeexQuality0 {
 public:
  explicit SpeexQuality0(int channels)
      : input_(Noise(kInputFrames * channels)), output_(2 * kInputFrames * channels) {
    int error = 0;
    resampler_ = speex_resampler_init(channels, kInputRate, kOutputRate, 0, &error);
  }
  ~SpeexQuality0() { speex_resampler_destroy(resampler_); }
  int64_t Run() {
    spx_uint32_t input_frames = kInputFrames;
    spx_uint32_t output_frames = 2 * kInputFrames;
    speex_resampler_process_interleaved_int(resampler_, input_.data(), &input_frames,
                                            output_.data(), &output_frames);
    benchmark::ClobberMemory();
    return output_frames;
  }

 private:
  std::vector<int16_t> input_;
  std::vector<int16_t> output_;
  SpeexResamplerState* resampler_;
};

void BM_SpeexQuality0(benchmark::State& state) {
  SpeexQuality0 reference(static_cast<int>(state.range(0)));
  MeasureFrames(state, &reference);
}
BENCHMARK(BM_SpeexQuality0)->ArgName("channels")->Arg(1)->Arg(2);
void BM_SpeedupOverSpeex(benchmark::State& state) { MeasureSpeedup<SpeexQuality0>(state); }
BENCHMARK(BM_SpeedupOverSpeex)->ArgName("channels")->Arg(1)->Arg(2);
#endif

}  // namespace
