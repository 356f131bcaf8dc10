// A tempo range in BPM for the tracker: its check, with a message that says
// what is allowed, and the tracker set-up it stands for.
#ifndef CLIPWEAVER_JNI_APM_TEMPO_RANGE_H_
#define CLIPWEAVER_JNI_APM_TEMPO_RANGE_H_

#include <cstdint>
#include <string>

#include "jni/apm/apm.h"

namespace apm {

constexpr double kSlowestTempo = 30.0;
constexpr double kFastestTempo = 1200.0;

// How the tracker weighs the tempi inside a range.
enum class TempoPrior {
  // The tracker's Gaussian, moved to the geometric middle of the range.
  kGeometricMiddle,
  // All tempi of the range alike.
  kFlat,
};

// Empty when the tracker can follow min_bpm..max_bpm at this frame rate,
// otherwise why not. A frame rate of 0 or less checks the range alone.
std::string TempoRangeError(double min_bpm, double max_bpm,
                            int32_t frames_per_second);

// The default set-up with the range's periods and prior. A range of two
// octaves or more around the default prior's centre says nothing about the
// metrical level, so it keeps the tracker's own prior.
ApmConfig ConfigForTempoRange(double min_bpm, double max_bpm,
                              TempoPrior prior = TempoPrior::kGeometricMiddle);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_TEMPO_RANGE_H_
