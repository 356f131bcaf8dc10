// Sends fd 2 to /dev/null while it lives, so that the library's log lines
// (written straight to stderr) stay off the terminal. Made once for a whole
// run: fd 2 is process-wide and worker threads log through it.
#ifndef CLIPWEAVER_TOOLS_STDERR_SILENCER_H_
#define CLIPWEAVER_TOOLS_STDERR_SILENCER_H_

namespace cwtool {

class StderrSilencer {
 public:
  explicit StderrSilencer(bool active);
  ~StderrSilencer();
  StderrSilencer(const StderrSilencer&) = delete;
  StderrSilencer& operator=(const StderrSilencer&) = delete;

 private:
  int saved_fd_ = -1;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_STDERR_SILENCER_H_
