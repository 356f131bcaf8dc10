// A tempo read off a list of beat times by a straight-line fit, free of the
// whole-frame steps of the tracker's median interval.
#ifndef CLIPWEAVER_JNI_APM_TEMPO_ESTIMATE_H_
#define CLIPWEAVER_JNI_APM_TEMPO_ESTIMATE_H_

#include <vector>

namespace apm {

// An interval is steady when it lies within this fraction of the median
// interval of one beat, or of two (one beat missed in between).
constexpr double kSteadyTolerance = 0.15;
// The ends of the run are dropped while they lie further than this
// fraction of a beat off the fitted line: a tracker settling keeps a steady
// but wrong period for a few beats. Whole-frame beats wander by a frame or
// two around the line (6 % of a beat at 190 BPM), and stay.
constexpr double kEndTolerance = 0.1;

// BPM from the least-squares slope of beat time against beat number over
// the longest run of steady intervals, less its ends that stray from the
// line; NaN with fewer than three beats or no run of two steady intervals.
// Beat times must ascend.
double PreciseTempo(const std::vector<double>& beat_times);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_TEMPO_ESTIMATE_H_
