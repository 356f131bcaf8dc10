#include "jni/apm/tempo_estimate.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace apm {
namespace {

// Beats spanned by an interval: 1 or 2 when steady, 0 otherwise.
int BeatsSpanned(double interval, double median) {
  for (int beats = 1; beats <= 2; ++beats) {
    if (std::fabs(interval - beats * median) <= kSteadyTolerance * median) {
      return beats;
    }
  }
  return 0;
}

}  // namespace

double PreciseTempo(const std::vector<double>& beat_times) {
  const double unknown = std::numeric_limits<double>::quiet_NaN();
  const size_t n = beat_times.size();
  if (n < 3) return unknown;
  std::vector<double> intervals(n - 1);
  for (size_t i = 0; i + 1 < n; ++i) {
    intervals[i] = beat_times[i + 1] - beat_times[i];
  }
  std::vector<double> sorted = intervals;
  const auto middle = sorted.begin() + sorted.size() / 2;
  std::nth_element(sorted.begin(), middle, sorted.end());
  const double median = *middle;
  if (!(median > 0)) return unknown;

  // The longest run of steady intervals, as a range of beats.
  size_t best_first = 0, best_count = 0, first = 0;
  for (size_t i = 0; i <= intervals.size(); ++i) {
    if (i < intervals.size() && BeatsSpanned(intervals[i], median) > 0) continue;
    if (i - first > best_count) {
      best_first = first;
      best_count = i - first;
    }
    first = i + 1;
  }
  if (best_count < 2) return unknown;

  // Beat numbers count the missed beats, so a gap does not bend the line.
  std::vector<double> number(best_count + 1, 0.0);
  for (size_t k = 1; k <= best_count; ++k) {
    number[k] = number[k - 1] +
                BeatsSpanned(intervals[best_first + k - 1], median);
  }
  double mean_x = 0, mean_t = 0;
  for (size_t k = 0; k <= best_count; ++k) {
    mean_x += number[k];
    mean_t += beat_times[best_first + k];
  }
  mean_x /= static_cast<double>(best_count + 1);
  mean_t /= static_cast<double>(best_count + 1);
  double sxt = 0, sxx = 0;
  for (size_t k = 0; k <= best_count; ++k) {
    const double dx = number[k] - mean_x;
    sxt += dx * (beat_times[best_first + k] - mean_t);
    sxx += dx * dx;
  }
  const double seconds_per_beat = sxt / sxx;
  return seconds_per_beat > 0 ? 60.0 / seconds_per_beat : unknown;
}

}  // namespace apm
