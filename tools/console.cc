#include "tools/console.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>

#include "tools/text_escape.h"

namespace cwtool {

Console::Console(int err_fd, int bar_rows)
    : err_fd_(err_fd), bars_on_(bar_rows > 0), bars_(bar_rows) {}

Console::~Console() { Finish(); }

void Console::WriteErr(const std::string& text) {
  const char* p = text.data();
  size_t left = text.size();
  while (left > 0) {
    const ssize_t n = write(err_fd_, p, left);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) return;
    p += n;
    left -= static_cast<size_t>(n);
  }
}

int Console::Columns() const {
  struct winsize size {};
  if (ioctl(err_fd_, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) {
    return size.ws_col;
  }
  return 80;
}

void Console::Result(const std::string& text) {
  std::lock_guard<std::mutex> hold(lock_);
  const bool shown = bars_.shown();
  if (shown) WriteErr(bars_.Erase());
  fputs(text.c_str(), stdout);
  fflush(stdout);
  if (shown) WriteErr(bars_.Draw(Columns()));
}

void Console::Message(const std::string& line) {
  std::lock_guard<std::mutex> hold(lock_);
  const bool shown = bars_.shown();
  std::string out = bars_.Erase() + TerminalText(line) + "\n";
  if (shown) out += bars_.Draw(Columns());
  WriteErr(out);
}

void Console::Progress(int row, const std::string& label, int percent) {
  std::lock_guard<std::mutex> hold(lock_);
  if (bars_on_ && bars_.Set(row, label, percent)) WriteErr(bars_.Draw(Columns()));
}

void Console::ProgressIdle(int row) {
  std::lock_guard<std::mutex> hold(lock_);
  if (!bars_on_) return;
  bars_.SetIdle(row);
  WriteErr(bars_.Draw(Columns()));
}

void Console::Finish() {
  std::lock_guard<std::mutex> hold(lock_);
  bars_on_ = false;
  WriteErr(bars_.Erase());
}

}  // namespace cwtool
