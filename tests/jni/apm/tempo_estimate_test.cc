#include "jni/apm/tempo_estimate.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "tests/shared_cases.h"

namespace apm {
namespace {

// The cases the Java twin checks too.
TEST(PreciseTempo, SharedBeatLists) {
  const std::vector<std::string> rows = shared_cases::Rows("precise_tempo_cases.tsv");
  EXPECT_GE(rows.size(), 15u);
  for (const std::string& line : rows) {
    std::istringstream fields(line);
    std::string name, runs, noise, bpm_text, tolerance;
    for (std::string* field : {&name, &runs, &noise, &bpm_text, &tolerance}) {
      std::getline(fields, *field, '\t');
    }
    const double bpm = std::stod(bpm_text);  // reads NaN, where >> does not
    std::istringstream run_fields(runs);
    std::vector<double> beats;
    double value, period;
    if (run_fields >> value) beats.push_back(value);
    for (int count; run_fields >> count >> period;) {
      const double from = beats.back();
      for (int k = 1; k <= count; ++k) beats.push_back(from + k * period);
    }
    std::mt19937 random(7);
    for (double& b : beats) {
      if (noise == "frames") b = std::round(b * 100) / 100;
      else if (noise != "0") b += std::normal_distribution<double>(0, std::stod(noise))(random);
    }
    const double got = PreciseTempo(beats);
    if (std::isnan(bpm)) {
      EXPECT_TRUE(std::isnan(got)) << name << ": " << got;
    } else {
      EXPECT_NEAR(got, bpm, std::stod(tolerance)) << name;
    }
  }
}

}  // namespace
}  // namespace apm
