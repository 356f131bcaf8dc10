// Conditioning of the detection function against its running median.
#ifndef CLIPWEAVER_JNI_APM_RUNNING_MEDIAN_H_
#define CLIPWEAVER_JNI_APM_RUNNING_MEDIAN_H_

#include <cstdint>
#include <vector>

namespace apm {

// Removes the slowly varying level: each value minus the upper median of
// the window_length values around it (fewer at the ends), kept when
// positive. Runs in place from left to right, so each window already sees
// the rewritten values to the left of its centre.
void SubtractRunningMedian(int32_t window_length, std::vector<float>* values);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_RUNNING_MEDIAN_H_
