// Selection with fuzzed slices, ranks, orders and values (NaN included),
// checked against a sort of the same slice when it holds no NaN.
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <vector>

#include "jni/select_nth.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size < 4) return 0;
  const size_t count = (size - 4) / 4;
  if (count == 0) return 0;
  std::vector<float> values(count);
  std::memcpy(values.data(), data + 4, count * 4);
  const int first = data[0] % count;
  const int last = first + 1 + data[1] % (count - first);
  const int nth = first + data[2] % (last - first);
  const int ascending = static_cast<int8_t>(data[3]);

  std::vector<float> work = values;
  const float selected = SelectNth(work.data(), first, nth, last, ascending);
  // Outside the slice nothing moves.
  for (int i = 0; i < static_cast<int>(count); ++i) {
    if ((i < first || i >= last) && std::memcmp(&work[i], &values[i], 4) != 0) abort();
  }
  std::vector<float> slice(values.begin() + first, values.begin() + last);
  if (std::any_of(slice.begin(), slice.end(), [](float v) { return std::isnan(v); })) {
    return 0;
  }
  if (ascending > 0) {
    std::sort(slice.begin(), slice.end());
  } else {
    std::sort(slice.begin(), slice.end(), std::greater<float>());
  }
  if (!(selected == slice[nth - first])) abort();
  return 0;
}
