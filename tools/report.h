// Beat results as text for people, CSV or JSON Lines for programs.
#ifndef CLIPWEAVER_TOOLS_REPORT_H_
#define CLIPWEAVER_TOOLS_REPORT_H_

#include <string>

#include "tools/beat_analysis.h"

namespace cwtool {

enum class ReportFormat { kText, kCsv, kJson };

class Report {
 public:
  explicit Report(ReportFormat format) : format_(format) {}

  // What comes before the first result (the CSV column names).
  std::string Header() const;
  std::string Result(const BeatResult& result) const;
  // What stdout carries for a file without a result: a JSON object with
  // the reason, so that JSON lines match the files one to one; nothing in
  // the other formats, where the reason goes to stderr only.
  std::string Failure(const std::string& path, const std::string& reason) const;

 private:
  ReportFormat format_;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_REPORT_H_
