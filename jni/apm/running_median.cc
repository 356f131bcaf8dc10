#include "jni/apm/running_median.h"

#include <algorithm>
#include <cmath>

namespace apm {
namespace {

// The running median by a selection over each window, for input with NaN.
void SubtractRunningMedianBySelection(int64_t half,
                                      std::vector<float>* values) {
  std::vector<float>& x = *values;
  const int64_t n = static_cast<int64_t>(x.size());
  std::vector<float> window;
  window.reserve(static_cast<size_t>(std::min<int64_t>(n, 2 * half + 1)));
  for (int64_t i = 0; i < n; ++i) {
    const int64_t lo = std::max<int64_t>(i - half, 0);
    const int64_t hi = std::min<int64_t>(i + half + 1, n);
    window.assign(x.begin() + lo, x.begin() + hi);
    auto middle = window.begin() + (hi - lo) / 2;
    std::nth_element(window.begin(), middle, window.end());
    const float d = x[i] - *middle;
    x[i] = d > 0 ? d : 0;
  }
}

}  // namespace

void SubtractRunningMedian(int32_t window_length, std::vector<float>* values) {
  std::vector<float>& x = *values;
  const int64_t n = static_cast<int64_t>(x.size());
  const int64_t half = window_length / 2;
  // NaN has no place in a sorted window; selection copes with it.
  if (half < 0 || std::any_of(x.begin(), x.end(),
                              [](float v) { return std::isnan(v); })) {
    SubtractRunningMedianBySelection(half, &x);
    return;
  }
  // The window kept sorted and moved a step at a time, instead of a
  // selection over the whole window at every value.
  int64_t lo = 0;
  int64_t hi = std::min(half + 1, n);
  std::vector<float> sorted(x.begin(), x.begin() + hi);
  std::sort(sorted.begin(), sorted.end());
  const auto erase = [&sorted](float v) {
    sorted.erase(std::lower_bound(sorted.begin(), sorted.end(), v));
  };
  const auto insert = [&sorted](float v) {
    sorted.insert(std::upper_bound(sorted.begin(), sorted.end(), v), v);
  };
  for (int64_t i = 0; i < n; ++i) {
    const float original = x[i];
    const float d = original - sorted[(hi - lo) / 2];
    x[i] = d > 0 ? d : 0;
    const int64_t next_lo = std::max<int64_t>(i + 1 - half, 0);
    const int64_t next_hi = std::min<int64_t>(i + half + 2, n);
    erase(original);
    if (i >= next_lo) insert(x[i]);
    // With no half window, x[i] itself was the value to leave.
    if (next_lo > lo && lo != i) erase(x[lo]);
    if (next_hi > hi) insert(x[hi]);
    lo = next_lo;
    hi = next_hi;
  }
}

}  // namespace apm
