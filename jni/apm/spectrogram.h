// Short-time spectrum of a mono stream: windowed, zero-padded frames taken
// every step_length_ samples and transformed with the real FFT.
//
// Frame t covers samples t*S .. t*S+W-1 of everything fed since Initialize
// (W = window length, S = step). Bin k of a frame holds the unscaled
// (sum x_j cos(2 pi j k / n), sum x_j sin(2 pi j k / n)) of the windowed
// frame, n = fft_length_, rounded to float; bins 0 and n/2 have imaginary 0.
#ifndef CLIPWEAVER_JNI_APM_SPECTROGRAM_H_
#define CLIPWEAVER_JNI_APM_SPECTROGRAM_H_

#include <complex>
#include <cstdint>
#include <functional>
#include <vector>

#include "base/aligned_allocator.h"

namespace apm {

using SpectrogramFrame = std::vector<std::complex<float>>;
using ProgressCallback = std::function<bool(float)>;

// Smallest power of two >= n, or 0 for n < 1.
int32_t NextPowerOfTwo(int32_t n);

// Periodic Hann window (denominator `length`, not length - 1).
void MakePeriodicHannWindow(int32_t length, std::vector<double>* window);

class Spectrogram {
 public:
  // Periodic Hann window of `window_length` samples.
  bool Initialize(int32_t window_length, int32_t step_length);
  bool Initialize(const std::vector<double>& window, int32_t step_length);

  // Replaces *output with the frames completed by `input`. Samples left over
  // stay queued for the next call, so a stream may be fed in pieces.
  // `progress` is called before frames 0, 100, 200, ... of this call with the
  // frame index over the number of whole steps in `input`; true cancels.
  bool ComputeComplexSpectrogram(const std::vector<float>& input,
                                 std::vector<SpectrogramFrame>* output,
                                 ProgressCallback progress);

  // Streaming steps, for callers that consume frames as they come.
  // TakeNextWindow takes samples from input[*input_start ..) and returns
  // true once a whole window is there; TransformWindow then leaves the
  // frame's bins in bins() as bin_count() (re, im) pairs of doubles. A
  // window that lies whole in `input` is read there, so `input` must stay
  // put until TransformWindow.
  bool TakeNextWindow(const float* input, int32_t input_size,
                      int32_t* input_start);
  void TransformWindow();
  const double* bins() const { return fft_buffer_.data(); }

  bool is_initialized() const { return is_initialized_; }
  int32_t fft_length() const { return fft_length_; }
  int32_t bin_count() const { return bin_count_; }
  int32_t window_length() const { return window_length_; }
  int32_t step_length() const { return step_length_; }

 private:
  int32_t fft_length_ = 0;
  int32_t bin_count_ = 0;
  int32_t window_length_ = 0;
  int32_t step_length_ = 0;
  bool is_initialized_ = false;
  std::vector<double> window_;
  CacheLineVector<double> fft_buffer_;
  // Only a window that straddles two inputs is gathered here; queue_[0 ..
  // queue_start_) belongs to frames already taken.
  std::vector<float> queue_;
  int32_t queue_start_ = 0;
  // Input samples to pass over before the next window begins.
  int32_t samples_to_skip_ = 0;
  const float* window_samples_ = nullptr;
  std::vector<int32_t> bit_reversal_work_;
  std::vector<double> twiddle_table_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_SPECTROGRAM_H_
