#include "tools/ordered_batch.h"

#include <algorithm>
#include <utility>

namespace cwtool {

OrderedBatch::OrderedBatch(size_t count, int workers, Job job)
    : count_(count), job_(std::move(job)), done_(count, false) {
  const size_t threads = std::min(count, static_cast<size_t>(std::max(workers, 1)));
  threads_.reserve(threads);
  for (size_t w = 0; w < threads; ++w) {
    threads_.emplace_back(&OrderedBatch::Work, this, static_cast<int>(w));
  }
}

OrderedBatch::~OrderedBatch() {
  for (std::thread& thread : threads_) thread.join();
}

void OrderedBatch::Work(int worker) {
  for (size_t index = next_++; index < count_; index = next_++) {
    job_(index, worker);
    {
      std::lock_guard<std::mutex> hold(lock_);
      done_[index] = true;
    }
    finished_.notify_all();
  }
}

void OrderedBatch::WaitFor(size_t index) {
  std::unique_lock<std::mutex> hold(lock_);
  finished_.wait(hold, [&] { return done_[index]; });
}

}  // namespace cwtool
