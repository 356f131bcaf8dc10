#include "tools/tempo_option.h"

#include <cerrno>
#include <cstdlib>

#include "jni/apm/analysis_frame_rate.h"
#include "jni/apm/tempo_range.h"
#include "tools/audio_file.h"

namespace cwtool {
namespace {

bool ParseNumber(const std::string& text, double* value) {
  if (text.empty()) return false;
  char* end = nullptr;
  errno = 0;
  *value = std::strtod(text.c_str(), &end);
  return errno == 0 && *end == '\0';
}

}  // namespace

std::string ParseTempoRange(const std::string& text, TempoRangeOption* range) {
  // The separator is the first '-' after the first character, so that a
  // negative minimum reaches the range check with its sign.
  const size_t dash = text.find('-', 1);
  if (dash == std::string::npos ||
      !ParseNumber(text.substr(0, dash), &range->min_bpm) ||
      !ParseNumber(text.substr(dash + 1), &range->max_bpm)) {
    return "--tempo '" + text + "' is not MIN-MAX in BPM, e.g. 150-200";
  }
  range->given = true;
  return apm::TempoRangeError(range->min_bpm, range->max_bpm, 0);
}

std::string CheckTempoRangeForFiles(const TempoRangeOption& range,
                                    const std::vector<std::string>& files) {
  if (!range.given) return std::string();
  for (const std::string& file : files) {
    AudioReader reader;
    std::string ignored;
    if (!reader.Open(file, &ignored)) continue;
    const std::string error = apm::TempoRangeError(
        range.min_bpm, range.max_bpm,
        apm::FrameRateAt(reader.sample_rate()).frames_per_second);
    if (!error.empty()) return file + ": " + error;
  }
  return std::string();
}

}  // namespace cwtool
