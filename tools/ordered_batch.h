// Runs count jobs on a few threads, each job on the first free worker, and
// lets the caller collect them in their own order as they complete.
#ifndef CLIPWEAVER_TOOLS_ORDERED_BATCH_H_
#define CLIPWEAVER_TOOLS_ORDERED_BATCH_H_

#include <atomic>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <mutex>
#include <thread>
#include <vector>

namespace cwtool {

class OrderedBatch {
 public:
  // job(index, worker) runs once for every index in 0..count-1; worker is
  // the number of the thread running it, 0..workers-1.
  using Job = std::function<void(size_t index, int worker)>;

  OrderedBatch(size_t count, int workers, Job job);
  // Joins the workers.
  ~OrderedBatch();
  OrderedBatch(const OrderedBatch&) = delete;
  OrderedBatch& operator=(const OrderedBatch&) = delete;

  // Blocks until job `index` has returned; whatever it wrote is then
  // visible to the caller.
  void WaitFor(size_t index);

 private:
  void Work(int worker);

  const size_t count_;
  const Job job_;
  std::atomic<size_t> next_{0};
  std::mutex lock_;
  std::condition_variable finished_;
  std::vector<bool> done_;
  std::vector<std::thread> threads_;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_ORDERED_BATCH_H_
