// The spectrogram with fuzzed window, step and piece sizes: feeding a signal
// in pieces must give exactly the frames of feeding it whole.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "jni/apm/spectrogram.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size < 4) return 0;
  const int32_t window = static_cast<int8_t>(data[0]) * 3;
  const int32_t step = static_cast<int8_t>(data[1]);
  const size_t piece_seed = data[2] | (data[3] << 8);
  std::vector<float> signal;
  for (size_t i = 4; i + 1 < size; i += 2) {
    signal.push_back(static_cast<float>(static_cast<int16_t>(data[i] | (data[i + 1] << 8))));
  }

  const apm::ProgressCallback none = [](float) { return false; };
  apm::Spectrogram whole, pieces;
  const bool ok = whole.Initialize(window, step);
  if (pieces.Initialize(window, step) != ok) abort();
  std::vector<apm::SpectrogramFrame> expected, frames, collected;
  if (whole.ComputeComplexSpectrogram(signal, &expected, none) != ok) abort();
  if (!ok) return 0;
  size_t start = 0, seed = piece_seed;
  while (start < signal.size()) {
    seed = seed * 1103515245u + 12345u;
    const size_t length = std::min<size_t>(seed % 97, signal.size() - start);
    const std::vector<float> piece(signal.begin() + start,
                                   signal.begin() + start + length);
    if (!pieces.ComputeComplexSpectrogram(piece, &frames, none)) abort();
    collected.insert(collected.end(), frames.begin(), frames.end());
    start += length;
  }
  if (collected != expected) abort();
  return 0;
}
