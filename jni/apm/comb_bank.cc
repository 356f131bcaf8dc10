#include "jni/apm/comb_bank.h"

#include <cmath>
#include <cstdint>
#include <cstring>

#include "jni/apm/tempo_model.h"

namespace apm {

float FloatOfExp(double y, double logged) {
  // exp(log(y)) is y to within a relative 2^-45 or so, as any libm's exp
  // and log come within a few ulps; 2^-40 leaves room for much worse. So
  // it rounds to the float nearest y unless y is about that close to a
  // point halfway between two floats: where the 29 bits a float drops
  // from y's mantissa are near 1000...0. 2^-40 of y is at most 2^13 ulps;
  // twice that is kept clear.
  if (y > 1e-30 && y < 1e30) {
    uint64_t bits;
    std::memcpy(&bits, &y, sizeof(bits));
    const int64_t dropped = static_cast<int64_t>(bits & ((1u << 29) - 1));
    const int64_t from_halfway = dropped - (int64_t{1} << 28);
    if (from_halfway > (1 << 14) || from_halfway < -(1 << 14)) {
      return static_cast<float>(y);
    }
  }
  return static_cast<float>(std::exp(logged));
}

void CombBank::Reset(const std::vector<int32_t>& lag_frames,
                     int32_t ring_rows, double input_weight,
                     double start_factor) {
  lag_frames_ = lag_frames;
  input_weight_ = input_weight;
  start_factor_ = start_factor;
  rows_ = ring_rows;
  outputs_.assign(lag_frames.size(), 0.0);
  // exp(0), as the outputs start at 0.
  exp_outputs_.assign(static_cast<size_t>(rows_) * lag_frames.size(), 1.0f);
}

const double* CombBank::Filter(const std::vector<float>& detection,
                               int32_t t) {
  // Locals, so that the stores to the outputs need not reload them.
  const double weight = input_weight_;
  const double start = start_factor_;
  const int32_t* lags = lag_frames_.data();
  const size_t count = lag_frames_.size();
  const float x = detection[t];
  double* out = outputs_.data();
  float* exp_out = exp_row(t);
  for (size_t i = 0; i < count; ++i) {
    const int32_t back = t - lags[i];
    float product = back >= 0 ? detection[back] * x
                              : static_cast<float>(start * x);
    if (weight < 1.0) {
      const float previous =
          back >= 0 ? exp_row(back)[i] : static_cast<float>(start);
      product =
          static_cast<float>(previous * (1.0 - weight) + weight * product);
    }
    const double y = product + kLogFloor;
    out[i] = std::log(y);
    if (weight < 1.0) exp_out[i] = FloatOfExp(y, out[i]);
  }
  return out;
}

}  // namespace apm
