// Forward real FFT with its tables already built, as the spectrogram runs it.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <vector>

#include "base/aligned_allocator.h"
#include "fft/real_fft.h"

#ifdef CLIPWEAVER_BENCH_FFTW
#include <fftw3.h>
#endif

namespace {

void BM_RealFftForward(benchmark::State& state) {
  const int n = static_cast<int>(state.range(0));
  std::vector<int> work(2 + static_cast<int>(std::sqrt(n / 2.0)), 0);
  std::vector<double> table(n / 2);
  std::vector<double> input(n);
  std::mt19937 random(1);
  std::uniform_real_distribution<double> value(-1.0, 1.0);
  for (double& v : input) v = value(random);
  // Aligned as FFTW's own buffers are.
  CacheLineVector<double> data(input.begin(), input.end());
  RealFft(n, 1, data.data(), work.data(), table.data());
  for (auto _ : state) {
    // A fresh copy each round keeps the values in range; it costs n copies.
    std::copy(input.begin(), input.end(), data.begin());
    RealFft(n, 1, data.data(), work.data(), table.data());
    benchmark::DoNotOptimize(data.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_RealFftForward)->Arg(512)->Arg(1024)->Arg(2048)->Arg(4096);

#ifdef CLIPWEAVER_BENCH_FFTW
// The reference: FFTW's planned double real-to-complex transform, with the
// same input copy per round.
void BM_FftwR2cMeasure(benchmark::State& state) {
  const int n = static_cast<int>(state.range(0));
  double* data = fftw_alloc_real(n);
  fftw_complex* out = fftw_alloc_complex(n / 2 + 1);
  const fftw_plan plan = fftw_plan_dft_r2c_1d(n, data, out, FFTW_MEASURE);
  std::vector<double> input(n);
  std::mt19937 random(1);
  std::uniform_real_distribution<double> value(-1.0, 1.0);
  for (double& v : input) v = value(random);
  for (auto _ : state) {
    std::copy(input.begin(), input.end(), data);
    fftw_execute(plan);
    benchmark::DoNotOptimize(out);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations());
  fftw_destroy_plan(plan);
  fftw_free(out);
  fftw_free(data);
}
BENCHMARK(BM_FftwR2cMeasure)->Arg(512)->Arg(1024)->Arg(2048)->Arg(4096);
#endif

}  // namespace
