// Two pieces of work in alternating batches, each batch timed apart. On a
// shared machine the times of separate runs move with the load, while
// batches a moment apart see the same load, so the ratio of the two holds.
#ifndef CLIPWEAVER_BENCH_ALTERNATING_BATCHES_H_
#define CLIPWEAVER_BENCH_ALTERNATING_BATCHES_H_

#include <benchmark/benchmark.h>

#include <chrono>

struct BatchSeconds {
  double first = 0;
  double second = 0;
};

// Each round of `state` runs a batch of `batch_size` calls of each, the
// one that goes first changing every round.
template <typename First, typename Second>
BatchSeconds TimeInAlternatingBatches(benchmark::State& state, int batch_size, First first,
                                      Second second) {
  using Clock = std::chrono::steady_clock;
  Clock::duration first_time{}, second_time{};
  const auto batch = [batch_size](auto& run, Clock::duration* total) {
    const Clock::time_point start = Clock::now();
    for (int i = 0; i < batch_size; ++i) run();
    *total += Clock::now() - start;
  };
  bool first_leads = true;
  for (auto _ : state) {
    if (first_leads) {
      batch(first, &first_time);
      batch(second, &second_time);
    } else {
      batch(second, &second_time);
      batch(first, &first_time);
    }
    first_leads = !first_leads;
  }
  return {std::chrono::duration<double>(first_time).count(),
          std::chrono::duration<double>(second_time).count()};
}

#endif  // CLIPWEAVER_BENCH_ALTERNATING_BATCHES_H_
