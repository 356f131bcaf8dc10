// Rows of progress bars kept at the bottom of a terminal and redrawn in
// place with ANSI cursor movements. Produces text only; the caller writes
// it.
#ifndef CLIPWEAVER_TOOLS_PROGRESS_BAR_H_
#define CLIPWEAVER_TOOLS_PROGRESS_BAR_H_

#include <string>
#include <vector>

namespace cwtool {

class ProgressBars {
 public:
  explicit ProgressBars(int rows);

  // False when the row already shows exactly this, so no redraw is due.
  bool Set(int row, const std::string& label, int percent);
  // An idle row is drawn blank.
  void SetIdle(int row);

  // Replaces what the last Draw left on the screen with the current rows,
  // each cut to `columns` so that no line wraps.
  std::string Draw(int columns);
  // Removes the rows and leaves the cursor where the first one began.
  std::string Erase();
  bool shown() const { return drawn_ > 0; }

  // "label [#######.......]  50%", at most `columns` wide.
  static std::string Line(const std::string& label, int percent, int columns);

 private:
  struct Row {
    std::string label;
    int percent = -1;  // -1: idle
  };
  std::vector<Row> rows_;
  int drawn_ = 0;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_PROGRESS_BAR_H_
