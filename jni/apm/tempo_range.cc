#include "jni/apm/tempo_range.h"

#include <cmath>
#include <cstdio>
#include <cstring>

namespace apm {
namespace {

// Two decimals at most, trailing zeros dropped; the Java twin writes the
// same text.
std::string Bpm(double value) {
  if (std::isnan(value)) return "NaN";
  if (std::isinf(value)) return value > 0 ? "Infinity" : "-Infinity";
  char text[48];
  snprintf(text, sizeof(text), "%.2f", value);
  char* end = text + strlen(text);
  while (end[-1] == '0') --end;
  if (end[-1] == '.') --end;
  const std::string out(text, end);
  return out == "-0" ? "0" : out;
}

// The tracker's own rounding of a period to frames.
double Lag(double period_ms, int32_t frames_per_second) {
  return std::round(period_ms * (0.001 * frames_per_second));
}

}  // namespace

std::string TempoRangeError(double min_bpm, double max_bpm,
                            int32_t frames_per_second) {
  const std::string range =
      "tempo range " + Bpm(min_bpm) + "-" + Bpm(max_bpm) + " BPM";
  const std::string allowed =
      Bpm(kSlowestTempo) + "-" + Bpm(kFastestTempo) + " BPM";
  if (!std::isfinite(min_bpm) || !std::isfinite(max_bpm)) {
    return range + " is not a range: both ends must be numbers within " +
           allowed;
  }
  if (!(min_bpm < max_bpm)) {
    return range + " is empty: the minimum must be below the maximum";
  }
  if (min_bpm < kSlowestTempo || max_bpm > kFastestTempo) {
    return range + " is outside " + allowed;
  }
  if (frames_per_second <= 0) return std::string();

  const ApmConfig config = ConfigForTempoRange(min_bpm, max_bpm);
  const double min_lag = Lag(config.min_period_ms, frames_per_second);
  const double max_lag = Lag(config.max_period_ms, frames_per_second);
  const int periods = static_cast<int>(max_lag - min_lag) + 1;
  const int states =
      static_cast<int>((min_lag + max_lag) * periods / 2);
  const std::string at = range + " is too narrow: at " +
                         std::to_string(frames_per_second) +
                         " frames per second it holds ";
  if (periods < 3) {
    return at + std::to_string(periods) + " beat period" +
           (periods == 1 ? "" : "s") + ", 3 are needed";
  }
  if (states < config.beam_width) {
    return at + std::to_string(states) + " tracker states, " +
           std::to_string(config.beam_width) + " are needed";
  }
  return std::string();
}

ApmConfig ConfigForTempoRange(double min_bpm, double max_bpm,
                              TempoPrior prior) {
  ApmConfig config;
  config.min_period_ms = 60000.0 / max_bpm;
  config.max_period_ms = 60000.0 / min_bpm;
  const double default_bpm = 60000.0 / config.tempo_prior_center_ms;
  const bool says_no_level = max_bpm >= 4.0 * min_bpm &&
                             min_bpm <= default_bpm && default_bpm <= max_bpm;
  if (says_no_level) return config;
  if (prior == TempoPrior::kFlat) {
    config.use_tempo_prior = false;
  } else {
    config.tempo_prior_center_ms = 60000.0 / std::sqrt(min_bpm * max_bpm);
  }
  return config;
}

}  // namespace apm
