#include "tools/wave_envelope.h"

#include <algorithm>
#include <utility>

namespace cwtool {

WaveEnvelope::WaveEnvelope(int32_t sample_rate, int32_t channels,
                           int32_t buckets_per_second)
    : sample_rate_(sample_rate),
      channels_(channels),
      buckets_per_second_(buckets_per_second) {}

void WaveEnvelope::Add(const int16_t* frames, int64_t count) {
  for (int64_t f = 0; f < count; ++f, ++frame_) {
    // Integer bucket boundaries, so that no rate drifts against the clock.
    const size_t bucket =
        static_cast<size_t>(frame_ * buckets_per_second_ / sample_rate_);
    if (bucket >= low_.size()) {
      low_.resize(bucket + 1, 0.0f);
      high_.resize(bucket + 1, 0.0f);
    }
    int32_t sum = 0;
    for (int c = 0; c < channels_; ++c) sum += frames[f * channels_ + c];
    const float v = static_cast<float>(sum) / static_cast<float>(channels_) / 32768.0f;
    low_[bucket] = std::min(low_[bucket], v);
    high_[bucket] = std::max(high_[bucket], v);
  }
}

void WaveEnvelope::Take(std::vector<float>* low, std::vector<float>* high) {
  *low = std::move(low_);
  *high = std::move(high_);
  low_.clear();
  high_.clear();
}

}  // namespace cwtool
