// The selection behind Algorithms.nthElement, apart from JNI.
#ifndef CLIPWEAVER_JNI_SELECT_NTH_H_
#define CLIPWEAVER_JNI_SELECT_NTH_H_

#include <algorithm>
#include <functional>

// The value that values[first, last) sorted ascending (ascending > 0) or
// descending would hold at nth; reorders the slice. Needs
// first <= nth < last.
inline float SelectNth(float* values, int first, int nth, int last,
                       int ascending) {
  if (ascending > 0) {
    std::nth_element(values + first, values + nth, values + last);
  } else {
    std::nth_element(values + first, values + nth, values + last,
                     std::greater<float>());
  }
  return values[nth];
}

#endif  // CLIPWEAVER_JNI_SELECT_NTH_H_
