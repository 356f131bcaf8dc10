#include "jni/apm/tempo_model.h"

#include <cmath>

namespace apm {

std::vector<double> TransitionScores(int32_t size, double weight,
                                     double step_ms, double sigma_ms) {
  std::vector<double> scores(size);
  for (int32_t d = 0; d < size; ++d) {
    const double x = d * step_ms;
    const double gaussian = std::exp(x * x / (sigma_ms * (sigma_ms * -2.0)));
    scores[d] = std::log(weight * gaussian + kLogFloor);
  }
  return scores;
}

std::vector<double> TempoPrior(const std::vector<int32_t>& lag_frames,
                               double frames_per_second, double center_ms,
                               double width, double weight) {
  std::vector<double> prior(lag_frames.size());
  for (size_t i = 0; i < lag_frames.size(); ++i) {
    const double z =
        std::log10(lag_frames[i] * 1000.0 / (center_ms * frames_per_second)) *
        (1.0 / width);
    prior[i] = weight * std::log(kLogFloor + std::exp(z * (z * -0.5)));
  }
  return prior;
}

}  // namespace apm
