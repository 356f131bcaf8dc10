#include "jni/apm/tempo_range.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "jni/apm/analysis_frame_rate.h"
#include "tests/shared_cases.h"

namespace apm {
namespace {

// The cases the Java twin checks too, so that both give the same verdicts.
TEST(TempoRange, SharedCasesGiveTheirMessages) {
  const std::vector<std::string> rows = shared_cases::Rows("tempo_range_cases.tsv");
  EXPECT_GE(rows.size(), 10u);
  for (const std::string& line : rows) {
    std::istringstream fields(line);
    std::string min, max, rate, message;
    std::getline(fields >> min >> max >> rate >> std::ws, message);
    // Through float, as the Java entry takes its range.
    const double min_bpm = static_cast<float>(std::strtod(min.c_str(), nullptr));
    const double max_bpm = static_cast<float>(std::strtod(max.c_str(), nullptr));
    EXPECT_EQ(TempoRangeError(min_bpm, max_bpm,
                              FrameRateAt(std::atoi(rate.c_str())).frames_per_second),
              message)
        << line;
  }
}

TEST(TempoRange, ConfigSetsPeriodsAndPrior) {
  const struct {
    double min, max;
    TempoPrior prior;
    bool use_prior;
    double center_ms;
  } rows[] = {
      // Two octaves or more around 120 BPM: the tracker's own prior.
      {75, 1200, TempoPrior::kGeometricMiddle, true, 500},
      {60, 240, TempoPrior::kFlat, true, 500},
      {50, 80, TempoPrior::kGeometricMiddle, true, 60000 / std::sqrt(4000.0)},
      {150, 210, TempoPrior::kFlat, false, 500},
      // Wide but away from 120 BPM.
      {200, 1200, TempoPrior::kGeometricMiddle, true, 60000 / std::sqrt(240000.0)},
  };
  for (const auto& row : rows) {
    const ApmConfig c = ConfigForTempoRange(row.min, row.max, row.prior);
    EXPECT_EQ(c.min_period_ms, 60000 / row.max) << row.min;
    EXPECT_EQ(c.max_period_ms, 60000 / row.min) << row.min;
    EXPECT_EQ(c.use_tempo_prior, row.use_prior) << row.min;
    EXPECT_EQ(c.tempo_prior_center_ms, row.center_ms) << row.min;
  }
}

}  // namespace
}  // namespace apm
