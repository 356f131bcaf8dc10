#include "tools/progress_bar.h"

#include <algorithm>
#include <cstdio>

namespace cwtool {
namespace {

constexpr int kLabelWidth = 24;
constexpr int kMaxBarWidth = 40;

// Keeps the end of a long name, which is the part that tells files apart.
std::string FitLabel(const std::string& label, size_t width) {
  if (label.size() <= width) return label + std::string(width - label.size(), ' ');
  if (width <= 3) return std::string(width, '.');
  return "..." + label.substr(label.size() - (width - 3));
}

}  // namespace

ProgressBars::ProgressBars(int rows) : rows_(static_cast<size_t>(std::max(rows, 0))) {}

bool ProgressBars::Set(int row, const std::string& label, int percent) {
  Row& r = rows_[static_cast<size_t>(row)];
  percent = std::clamp(percent, 0, 100);
  if (r.percent == percent && r.label == label) return false;
  r.label = label;
  r.percent = percent;
  return true;
}

void ProgressBars::SetIdle(int row) { rows_[static_cast<size_t>(row)] = Row{}; }

std::string ProgressBars::Line(const std::string& label, int percent,
                               int columns) {
  // " [" + bar + "] " + "100%"
  const int fixed = 2 + 2 + 4;
  const int room = columns - 1 - fixed;  // the last column stays free
  if (room < 4) return std::string();
  const int label_width = std::min(kLabelWidth, room / 2);
  const int bar_width = std::min(kMaxBarWidth, room - label_width);
  const int filled = bar_width * percent / 100;
  char tail[8];
  snprintf(tail, sizeof(tail), "] %3d%%", percent);
  return FitLabel(label, static_cast<size_t>(label_width)) + " [" +
         std::string(static_cast<size_t>(filled), '#') +
         std::string(static_cast<size_t>(bar_width - filled), '.') + tail;
}

std::string ProgressBars::Draw(int columns) {
  std::string out = Erase();
  for (const Row& row : rows_) {
    if (row.percent >= 0) out += Line(row.label, row.percent, columns);
    out += '\n';
  }
  drawn_ = static_cast<int>(rows_.size());
  return out;
}

std::string ProgressBars::Erase() {
  if (drawn_ == 0) return std::string();
  // Up to the first row, then clear to the end of the screen.
  std::string out = "\r\033[" + std::to_string(drawn_) + "A\033[J";
  drawn_ = 0;
  return out;
}

}  // namespace cwtool
