// The frame timing the beat analysis gives a sample rate: the spectrogram
// steps by the window less the overlap, and the tracker counts whole frames
// per second, so at rates the step does not divide its seconds run slow.
#ifndef CLIPWEAVER_JNI_APM_ANALYSIS_FRAME_RATE_H_
#define CLIPWEAVER_JNI_APM_ANALYSIS_FRAME_RATE_H_

#include <cstdint>

namespace apm {

struct AnalysisFrameRate {
  int32_t step = 0;               // samples; 0 for an unusable rate
  int32_t frames_per_second = 0;  // as the tracker counts them
  double true_frames_per_second = 0;
};

AnalysisFrameRate FrameRateAt(double sample_rate);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_ANALYSIS_FRAME_RATE_H_
