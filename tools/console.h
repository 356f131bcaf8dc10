// Everything the tool shows while it works: results on stdout, its own
// messages and the progress bars on the real stderr. One lock for all of
// it, so that worker threads never interleave half lines and a result is
// never printed through a bar.
#ifndef CLIPWEAVER_TOOLS_CONSOLE_H_
#define CLIPWEAVER_TOOLS_CONSOLE_H_

#include <mutex>
#include <string>

#include "tools/progress_bar.h"

namespace cwtool {

class Console {
 public:
  // err_fd: where messages go (a duplicate of the real stderr, which stays
  // usable while fd 2 is silenced). bar_rows > 0 shows that many bars.
  Console(int err_fd, int bar_rows);
  ~Console();
  Console(const Console&) = delete;
  Console& operator=(const Console&) = delete;

  void Result(const std::string& text);
  // One line, its control characters escaped; the newline is added.
  void Message(const std::string& line);
  void Progress(int row, const std::string& label, int percent);
  void ProgressIdle(int row);
  // Takes the bars off the screen for good.
  void Finish();

 private:
  void WriteErr(const std::string& text);
  int Columns() const;

  std::mutex lock_;
  const int err_fd_;
  bool bars_on_;
  ProgressBars bars_;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_CONSOLE_H_
