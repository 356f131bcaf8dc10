// One comb filter per lag: how strongly the detection function repeats at
// that period, as the log of the product of values one period apart, mixed
// with the filter's own output one period earlier.
#ifndef CLIPWEAVER_JNI_APM_COMB_BANK_H_
#define CLIPWEAVER_JNI_APM_COMB_BANK_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace apm {

// static_cast<float>(std::exp(logged)) for logged = std::log(y), mostly
// without calling exp.
float FloatOfExp(double y, double logged);

class CombBank {
 public:
  // input_weight of 1 or more leaves the filters without feedback;
  // start_factor stands for the input and the output one period before
  // the first frame. The feedback of ring_rows frames is kept; reading one
  // period back needs the longest lag plus one.
  void Reset(const std::vector<int32_t>& lag_frames, int32_t ring_rows,
             double input_weight, double start_factor);

  // Filters frame t (0, 1, ... in turn) and returns every lag's output,
  // valid until the next call.
  const double* Filter(const std::vector<float>& detection, int32_t t);

 private:
  float* exp_row(int32_t t) {
    return exp_outputs_.data() + static_cast<size_t>(t % rows_) * lag_frames_.size();
  }

  std::vector<int32_t> lag_frames_;
  double input_weight_ = 0.0;
  double start_factor_ = 0.0;
  int32_t rows_ = 0;
  // This frame's outputs.
  std::vector<double> outputs_;
  // The feedback reads every output once, through exp and as a float: a
  // ring of ring_rows frames of them, kept so from when each was made.
  std::vector<float> exp_outputs_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_COMB_BANK_H_
