// The rows of a case table under tests/jni/apm/ that the native and the
// Java tests both read, less blank and comment lines; none if unreadable.
#ifndef CLIPWEAVER_TESTS_SHARED_CASES_H_
#define CLIPWEAVER_TESTS_SHARED_CASES_H_

#include <fstream>
#include <string>
#include <vector>

namespace shared_cases {

inline std::vector<std::string> Rows(const std::string& name) {
  std::ifstream file(CLIPWEAVER_SOURCE_DIR "/tests/jni/apm/" + name);
  std::vector<std::string> rows;
  for (std::string line; std::getline(file, line);) {
    if (!line.empty() && line[0] != '#') rows.push_back(line);
  }
  return rows;
}

}  // namespace shared_cases

#endif  // CLIPWEAVER_TESTS_SHARED_CASES_H_
