// The waveform reduced to its lowest and highest value per short bucket,
// enough to draw it at any zoom down to a few milliseconds per pixel.
#ifndef CLIPWEAVER_TOOLS_WAVE_ENVELOPE_H_
#define CLIPWEAVER_TOOLS_WAVE_ENVELOPE_H_

#include <cstdint>
#include <vector>

namespace cwtool {

class WaveEnvelope {
 public:
  WaveEnvelope(int32_t sample_rate, int32_t channels, int32_t buckets_per_second);

  // Interleaved 16-bit frames, fed in order in blocks of any size.
  void Add(const int16_t* frames, int64_t count);
  // The buckets so far, the last one possibly partial.
  const std::vector<float>& low() const { return low_; }
  const std::vector<float>& high() const { return high_; }
  // Hands the buckets over, leaving the envelope empty: long tracks have
  // megabytes of them.
  void Take(std::vector<float>* low, std::vector<float>* high);

 private:
  int32_t sample_rate_;
  int32_t channels_;
  int32_t buckets_per_second_;
  int64_t frame_ = 0;
  std::vector<float> low_, high_;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_WAVE_ENVELOPE_H_
