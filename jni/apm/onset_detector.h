// Complex-domain onset detection: each bin of a frame is predicted from the
// two frames before it (magnitude of the last one, phase advancing by the
// last phase step); a frame's value is the summed distance between the
// predictions and the actual bins. Steady tones score near zero, new energy
// and phase jumps score high.
//
// Phases are carried as unit phasors (X / |X|) rather than angles: the
// prediction u1 * u1 * conj(u2) is then a few products instead of atan2,
// cos and sin per bin, and the loops vectorise. Before the first frames the
// magnitudes count as 0 and the phases as -pi.
#ifndef CLIPWEAVER_JNI_APM_ONSET_DETECTOR_H_
#define CLIPWEAVER_JNI_APM_ONSET_DETECTOR_H_

#include <complex>
#include <cstdint>
#include <vector>

#include "jni/apm/spectrogram.h"

namespace apm {

class OnsetDetector {
 public:
  // Appends one value per frame to *output (emptied first if clear_output).
  // progress gets frame / frame count before frames 0, 100, 200, ...; true
  // cancels. False for no frames, frames of differing sizes, or cancel.
  bool ComputeDetectionFunction(const std::vector<SpectrogramFrame>& spectrogram,
                                std::vector<float>* output,
                                ProgressCallback progress, bool clear_output);

  // Streaming form: Reset for frames of `bin_count` bins, then one
  // DetectFrame per frame in time order.
  void Reset(int32_t bin_count);
  float DetectFrame(const std::complex<float>* bins);
  // The same for bins of doubles, (re, im) pairs, taken at the nearest float.
  float DetectFrame(const double* bins);

  // For a pass whose values DetectFrame already produced: the report and the
  // progress calls that ComputeDetectionFunction makes over `frame_count`
  // frames, with the same outcome.
  bool ReplayPass(int32_t frame_count, const ProgressCallback& progress) const;

 private:
  static bool EmptyInput();
  template <typename T>
  float Detect(const T* bins);

  int32_t bin_count_ = 0;
  // Frame t - 1: magnitudes and unit phasors; frame t - 2: unit phasors.
  std::vector<float> previous_magnitudes_;
  std::vector<float> previous_phasors_re_;
  std::vector<float> previous_phasors_im_;
  std::vector<float> second_previous_phasors_re_;
  std::vector<float> second_previous_phasors_im_;
};

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_ONSET_DETECTOR_H_
