#include "jni/apm/onset_detector.h"

#include <cmath>

#include "base/float4.h"
#include "base/instruction_set.h"
#include "base/logging.h"
#include "jni/apm/onset_bins.h"
#include "jni/apm/onset_bins_avx.h"

namespace apm {
namespace {

// The phasor of the phase -pi (as the float nearest to pi).
constexpr float kStartPhasorRe = -1.0f;
constexpr float kStartPhasorIm = 8.742278e-8f;

// Sums four lanes side by side, then pairwise, then the rest: equal on every width.
template <typename T>
float DetectRest(const T* x, int32_t k, int32_t count, float* const* s, simd::Float4 lanes) {
  for (; k + 4 <= count; k += 4) {
    lanes = lanes + DetectBins<simd::Float4>(x, k, s[0], s[1], s[2], s[3], s[4]);
  }
  float lane[4];
  simd::Store(lane, lanes);
  float sum = (lane[0] + lane[1]) + (lane[2] + lane[3]);
  for (; k < count; ++k) sum += DetectBins<float>(x, k, s[0], s[1], s[2], s[3], s[4]);
  return sum;
}

}  // namespace

bool OnsetDetector::EmptyInput() {
  LOG(ERROR) << "Empty input for onset detector! ";
  return false;
}

bool OnsetDetector::ComputeDetectionFunction(
    const std::vector<SpectrogramFrame>& spectrogram, std::vector<float>* output,
    ProgressCallback progress, bool clear_output) {
  if (clear_output) output->clear();
  if (spectrogram.empty()) return EmptyInput();
  Reset(static_cast<int32_t>(spectrogram[0].size()));
  const int32_t frame_count = static_cast<int32_t>(spectrogram.size());
  for (int32_t t = 0; t < frame_count; ++t) {
    if (t % 100 == 0 && progress(static_cast<float>(t) / frame_count)) {
      return false;
    }
    if (static_cast<int32_t>(spectrogram[t].size()) != bin_count_) {
      LOG(ERROR) << "Onset detector frame " << t << " has "
                 << spectrogram[t].size() << " bins, expected " << bin_count_;
      return false;
    }
    output->push_back(DetectFrame(spectrogram[t].data()));
  }
  return true;
}

bool OnsetDetector::ReplayPass(int32_t frame_count,
                               const ProgressCallback& progress) const {
  if (frame_count == 0) return EmptyInput();
  for (int32_t t = 0; t < frame_count; t += 100) {
    if (progress(static_cast<float>(t) / frame_count)) return false;
  }
  return true;
}

void OnsetDetector::Reset(int32_t bin_count) {
  bin_count_ = bin_count;
  previous_magnitudes_.assign(bin_count, 0.0f);
  previous_phasors_re_.assign(bin_count, kStartPhasorRe);
  previous_phasors_im_.assign(bin_count, kStartPhasorIm);
  second_previous_phasors_re_.assign(bin_count, kStartPhasorRe);
  second_previous_phasors_im_.assign(bin_count, kStartPhasorIm);
}

float OnsetDetector::DetectFrame(const std::complex<float>* bins) {
  return Detect(reinterpret_cast<const float*>(bins));
}

float OnsetDetector::DetectFrame(const double* bins) { return Detect(bins); }

template <typename T>
float OnsetDetector::Detect(const T* x) {
  float* state[] = {previous_magnitudes_.data(), previous_phasors_re_.data(),
                    previous_phasors_im_.data(), second_previous_phasors_re_.data(),
                    second_previous_phasors_im_.data()};
  // The eight-lane kernel leaves its partial sums four lanes wide.
  float lane[4] = {0, 0, 0, 0};
  int32_t k = 0;
#if defined(__x86_64__)
  if (instruction_set::HasAvx()) {
    k = DetectBinsAvx(x, bin_count_, state[0], state[1], state[2], state[3], state[4], lane);
  }
#endif
  return DetectRest(x, k, bin_count_, state, simd::Load<simd::Float4>(lane));
}

}  // namespace apm
