#include "jni/apm/spectrogram.h"

#include <algorithm>
#include <cmath>

#include "base/logging.h"
#include "fft/real_fft.h"

namespace apm {

// Beyond this the next power of two overflows int32.
constexpr int32_t kMaxWindowLength = 1 << 30;

int32_t NextPowerOfTwo(int32_t n) {
  if (n < 1) return 0;
  int32_t p = 1;
  while (p < n) p <<= 1;
  return p;
}

void MakePeriodicHannWindow(int32_t length, std::vector<double>* window) {
  window->resize(length);
  for (int32_t i = 0; i < length; ++i) {
    (*window)[i] = 0.5 - std::cos(i * 6.283185307179586 / length) * 0.5;
  }
}

bool Spectrogram::Initialize(int32_t window_length, int32_t step_length) {
  if (window_length > kMaxWindowLength) {
    LOG(ERROR) << "Window length too long.";
    is_initialized_ = false;
    return false;
  }
  // A negative length is as unusable as an empty window.
  std::vector<double> window;
  MakePeriodicHannWindow(std::max(window_length, 0), &window);
  return Initialize(window, step_length);
}

bool Spectrogram::Initialize(const std::vector<double>& window,
                             int32_t step_length) {
  if (&window != &window_) window_ = window;
  if (window_.size() > kMaxWindowLength) {
    LOG(ERROR) << "Window length too long.";
    is_initialized_ = false;
    return false;
  }
  window_length_ = static_cast<int32_t>(window_.size());
  if (window_length_ < 2) {
    LOG(ERROR) << "Window length too short.";
    is_initialized_ = false;
    return false;
  }
  step_length_ = step_length;
  if (step_length < 1) {
    LOG(ERROR) << "Step length must be positive.";
    is_initialized_ = false;
    return false;
  }
  fft_length_ = NextPowerOfTwo(window_length_);
  CHECK(fft_length_ >= window_length_);
  bin_count_ = fft_length_ / 2 + 1;
  fft_buffer_.assign(fft_length_ + 2, 0.0);
  twiddle_table_.assign(fft_length_ / 2, 0.0);
  bit_reversal_work_.assign(
      2 + static_cast<int32_t>(std::sqrt(static_cast<double>(fft_length_ / 2))),
      0);
  sample_queue_.clear();
  sample_queue_.reserve(static_cast<size_t>(window_length_) +
                        std::max(step_length_, window_length_));
  is_initialized_ = true;
  samples_needed_ = window_length_;
  return true;
}

bool Spectrogram::ComputeComplexSpectrogram(
    const std::vector<float>& input, std::vector<SpectrogramFrame>* output,
    ProgressCallback progress) {
  if (!is_initialized_) {
    LOG(ERROR) << "ComputeComplexSpectrogram() called before successful call "
                  "to Initialize().";
    return false;
  }
  CHECK(output);
  output->clear();
  const int32_t input_size = static_cast<int32_t>(input.size());
  int32_t input_start = 0;
  int32_t frame = 0;
  const float steps = static_cast<float>(input_size / step_length_);
  while (TakeNextWindow(input.data(), input_size, &input_start)) {
    if (frame % 100 == 0) {
      // A call shorter than one step may still finish a queued frame.
      const float fraction = steps > 0 ? static_cast<float>(frame) / steps : 0;
      if (progress(fraction)) return false;
    }
    TransformWindow();
    SpectrogramFrame& bins = output->emplace_back(bin_count_);
    for (int32_t k = 0; k < bin_count_; ++k) {
      bins[k] = {static_cast<float>(fft_buffer_[2 * k]),
                 static_cast<float>(fft_buffer_[2 * k + 1])};
    }
    ++frame;
  }
  return true;
}

bool Spectrogram::TakeNextWindow(const float* input, int32_t input_size,
                                 int32_t* input_start) {
  const int32_t remaining = input_size - *input_start;
  if (samples_needed_ > remaining) {
    sample_queue_.insert(sample_queue_.end(), input + *input_start,
                         input + input_size);
    *input_start += remaining;
    samples_needed_ -= remaining;
    return false;
  }
  sample_queue_.insert(sample_queue_.end(), input + *input_start,
                       input + *input_start + samples_needed_);
  *input_start += samples_needed_;
  if (static_cast<int32_t>(sample_queue_.size()) > window_length_) {
    sample_queue_.erase(sample_queue_.begin(),
                        sample_queue_.end() - window_length_);
  }
  samples_needed_ = step_length_;
  return true;
}

void Spectrogram::TransformWindow() {
  const double* samples = sample_queue_.data();
  for (int32_t j = 0; j < window_length_; ++j) {
    fft_buffer_[j] = window_[j] * samples[j];
  }
  for (int32_t j = window_length_; j < fft_length_; ++j) fft_buffer_[j] = 0.0;
  RealFft(fft_length_, 1, fft_buffer_.data(), bit_reversal_work_.data(),
          twiddle_table_.data());
  fft_buffer_[fft_length_] = fft_buffer_[1];
  fft_buffer_[fft_length_ + 1] = 0.0;
  fft_buffer_[1] = 0.0;
}

}  // namespace apm
