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

struct Line {
  double slope = 0, mean_x = 0, mean_t = 0;
  double Residual(double x, double t) const {
    return t - mean_t - slope * (x - mean_x);
  }
};

// Least squares of t against x over the points lo..hi.
Line Fit(const std::vector<double>& x, const double* t, size_t lo, size_t hi) {
  Line line;
  const double count = static_cast<double>(hi - lo + 1);
  for (size_t k = lo; k <= hi; ++k) {
    line.mean_x += x[k];
    line.mean_t += t[k];
  }
  line.mean_x /= count;
  line.mean_t /= count;
  double sxt = 0, sxx = 0;
  for (size_t k = lo; k <= hi; ++k) {
    const double dx = x[k] - line.mean_x;
    sxt += dx * (t[k] - line.mean_t);
    sxx += dx * dx;
  }
  line.slope = sxt / sxx;
  return line;
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
  const double* times = beat_times.data() + best_first;
  // A tracker settling on its period drifts off the line of the locked
  // beats: the end further off goes until both ends fit.
  size_t lo = 0, hi = best_count;
  Line line = Fit(number, times, lo, hi);
  while (hi - lo >= 3) {
    const double off_lo = std::fabs(line.Residual(number[lo], times[lo]));
    const double off_hi = std::fabs(line.Residual(number[hi], times[hi]));
    const double limit = kEndTolerance * line.slope;
    if (off_lo <= limit && off_hi <= limit) break;
    off_lo >= off_hi ? ++lo : --hi;
    line = Fit(number, times, lo, hi);
  }
  return line.slope > 0 ? 60.0 / line.slope : unknown;
}

}  // namespace apm
