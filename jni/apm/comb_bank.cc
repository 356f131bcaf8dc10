#include "jni/apm/comb_bank.h"

#include <cmath>

#include "jni/apm/tempo_model.h"

namespace apm {

void CombBank::Reset(const std::vector<int32_t>& lag_frames,
                     int32_t ring_rows, double input_weight,
                     double start_factor) {
  lag_frames_ = lag_frames;
  input_weight_ = input_weight;
  start_factor_ = start_factor;
  rows_ = ring_rows;
  outputs_.assign(static_cast<size_t>(rows_) * lag_frames.size(), 0.0);
}

const double* CombBank::Filter(const std::vector<float>& detection,
                               int32_t t) {
  // Locals, so that the stores to the outputs need not reload them.
  const double weight = input_weight_;
  const double start = start_factor_;
  const int32_t* lags = lag_frames_.data();
  const size_t count = lag_frames_.size();
  const float x = detection[t];
  double* out = row(t);
  for (size_t i = 0; i < count; ++i) {
    const int32_t back = t - lags[i];
    float product = back >= 0 ? detection[back] * x
                              : static_cast<float>(start * x);
    if (weight < 1.0) {
      const float previous =
          static_cast<float>(back >= 0 ? std::exp(row(back)[i]) : start);
      product =
          static_cast<float>(previous * (1.0 - weight) + weight * product);
    }
    out[i] = std::log(product + kLogFloor);
  }
  return out;
}

}  // namespace apm
