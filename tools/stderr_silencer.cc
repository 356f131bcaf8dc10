#include "tools/stderr_silencer.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstdio>

namespace cwtool {

StderrSilencer::StderrSilencer(bool active) {
  if (!active) return;
  const int null_fd = open("/dev/null", O_WRONLY | O_CLOEXEC);
  if (null_fd < 0) return;
  fflush(stderr);
  saved_fd_ = fcntl(STDERR_FILENO, F_DUPFD_CLOEXEC, 0);
  if (saved_fd_ >= 0) dup2(null_fd, STDERR_FILENO);
  close(null_fd);
}

StderrSilencer::~StderrSilencer() {
  if (saved_fd_ < 0) return;
  fflush(stderr);
  dup2(saved_fd_, STDERR_FILENO);
  close(saved_fd_);
}

}  // namespace cwtool
