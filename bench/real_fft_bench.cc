// Forward real FFT with its tables already built, as the spectrogram runs it.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <vector>

#include "base/aligned_allocator.h"
#include "bench/alternating_batches.h"
#include "fft/real_fft.h"

#ifdef CLIPWEAVER_BENCH_FFTW
#include <fftw3.h>
#endif

namespace {

std::vector<double> Input(int n) {
  std::vector<double> input(n);
  std::mt19937 random(1);
  std::uniform_real_distribution<double> value(-1.0, 1.0);
  for (double& v : input) v = value(random);
  return input;
}

// Each round copies the input in afresh, which keeps the values in range and
// costs n copies; FFTW's rounds do the same.
class OurTransform {
 public:
  explicit OurTransform(int n)
      : n_(n),
        work_(2 + static_cast<int>(std::sqrt(n / 2.0)), 0),
        table_(n / 2),
        input_(Input(n)),
        data_(input_.begin(), input_.end()) {
    RealFft(n_, 1, data_.data(), work_.data(), table_.data());
  }
  void Run() {
    std::copy(input_.begin(), input_.end(), data_.begin());
    RealFft(n_, 1, data_.data(), work_.data(), table_.data());
    benchmark::DoNotOptimize(data_.data());
    benchmark::ClobberMemory();
  }

 private:
  int n_;
  std::vector<int> work_;
  std::vector<double> table_;
  std::vector<double> input_;
  // Aligned as FFTW's own buffers are.
  CacheLineVector<double> data_;
};

void BM_RealFftForward(benchmark::State& state) {
  OurTransform transform(static_cast<int>(state.range(0)));
  for (auto _ : state) transform.Run();
  state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_RealFftForward)->Arg(512)->Arg(1024)->Arg(2048)->Arg(4096);

#ifdef CLIPWEAVER_BENCH_FFTW
// The reference: FFTW's planned double real-to-complex transform.
class FftwTransform {
 public:
  explicit FftwTransform(int n)
      : input_(Input(n)),
        data_(fftw_alloc_real(n)),
        out_(fftw_alloc_complex(n / 2 + 1)),
        plan_(fftw_plan_dft_r2c_1d(n, data_, out_, FFTW_MEASURE)) {}
  ~FftwTransform() {
    fftw_destroy_plan(plan_);
    fftw_free(out_);
    fftw_free(data_);
  }
  void Run() {
    std::copy(input_.begin(), input_.end(), data_);
    fftw_execute(plan_);
    benchmark::DoNotOptimize(out_);
    benchmark::ClobberMemory();
  }

 private:
  std::vector<double> input_;
  double* data_;
  fftw_complex* out_;
  fftw_plan plan_;
};

void BM_FftwR2cMeasure(benchmark::State& state) {
  FftwTransform transform(static_cast<int>(state.range(0)));
  for (auto _ : state) transform.Run();
  state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_FftwR2cMeasure)->Arg(512)->Arg(1024)->Arg(2048)->Arg(4096);

// Both in alternating batches (alternating_batches.h).
void BM_RealFftOverFftw(benchmark::State& state) {
  const int n = static_cast<int>(state.range(0));
  OurTransform ours(n);
  FftwTransform fftw(n);
  const BatchSeconds seconds =
      TimeInAlternatingBatches(state, 32, [&] { ours.Run(); }, [&] { fftw.Run(); });
  state.counters["ratio"] = seconds.first / seconds.second;
}
BENCHMARK(BM_RealFftOverFftw)->Arg(512)->Arg(1024)->Arg(2048)->Arg(4096);
#endif

}  // namespace
