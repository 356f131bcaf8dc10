#include "jni/apm/spectrogram.h"

#include <algorithm>
#include <cmath>

#include "base/logging.h"
#include "jni/apm/frame_transform.h"

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
  queue_.clear();
  queue_.reserve(window_length_);
  queue_start_ = 0;
  samples_to_skip_ = 0;
  is_initialized_ = true;
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
    // Filled as it grows: zeroing it first would be work thrown away.
    SpectrogramFrame& bins = output->emplace_back();
    bins.reserve(bin_count_);
    for (int32_t k = 0; k < bin_count_; ++k) {
      bins.emplace_back(static_cast<float>(fft_buffer_[2 * k]),
                        static_cast<float>(fft_buffer_[2 * k + 1]));
    }
    ++frame;
  }
  return true;
}

bool Spectrogram::TakeNextWindow(const float* input, int32_t input_size,
                                 int32_t* input_start) {
  const int32_t skipped = std::min(samples_to_skip_, input_size - *input_start);
  *input_start += skipped;
  samples_to_skip_ -= skipped;
  if (samples_to_skip_ > 0) return false;
  const int32_t available = input_size - *input_start;
  const int32_t queued = static_cast<int32_t>(queue_.size()) - queue_start_;
  if (queued == 0 && available >= window_length_) {
    window_samples_ = input + *input_start;
    samples_to_skip_ = step_length_;
    return true;
  }
  queue_.erase(queue_.begin(), queue_.begin() + queue_start_);
  queue_start_ = 0;
  const int32_t needed = window_length_ - queued;
  if (available < needed) {
    queue_.insert(queue_.end(), input + *input_start, input + input_size);
    *input_start = input_size;
    return false;
  }
  queue_.insert(queue_.end(), input + *input_start,
                input + *input_start + needed);
  *input_start += needed;
  window_samples_ = queue_.data();
  // Kept in place until the next call, since the frame still reads it.
  queue_start_ = std::min(step_length_, window_length_);
  samples_to_skip_ = std::max(step_length_ - window_length_, 0);
  return true;
}

void Spectrogram::TransformWindow() {
  TransformFrame(window_samples_, window_.data(), window_length_, fft_length_,
                 fft_buffer_.data(), bit_reversal_work_.data(),
                 twiddle_table_.data());
}

}  // namespace apm
