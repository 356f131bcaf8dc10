#include "tools/output_file.h"

#include <fcntl.h>
#include <limits.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

namespace cwtool {
namespace {

// mkstemp makes files 0600; a new output gets the mode a plain creation
// would give it. The umask can only be read by setting it: done once, and
// harmless to concurrent temporary files, whose modes are set explicitly.
mode_t CreationMode() {
  static const mode_t mode = [] {
    const mode_t mask = umask(0);
    umask(mask);
    return static_cast<mode_t>(0666 & ~mask);
  }();
  return mode;
}

// Writing through a symbolic link replaces what it points to, as a plain
// open would, rather than the link itself.
bool ResolveTarget(const std::string& path, std::string* target,
                   mode_t* mode, std::string* error) {
  *target = path;
  *mode = CreationMode();
  struct stat status;
  if (lstat(path.c_str(), &status) != 0) return true;
  if (S_ISLNK(status.st_mode)) {
    char resolved[PATH_MAX];
    if (realpath(path.c_str(), resolved) == nullptr ||
        stat(resolved, &status) != 0) {
      *error = "cannot write: a symbolic link that leads nowhere";
      return false;
    }
    *target = resolved;
  }
  if (!S_ISREG(status.st_mode)) {
    // Renaming onto a device or a pipe would replace it, not write to it.
    *error = "cannot write: exists and is not a regular file";
    return false;
  }
  // A file written over keeps its permissions, as it would with O_TRUNC.
  *mode = status.st_mode & 07777;
  return true;
}

}  // namespace

std::string WriteErrorText(int errno_value) {
  switch (errno_value) {
    case ENOENT:
      return "cannot write: no such directory";
    case EACCES:
    case EPERM:
      return "cannot write: permission denied";
    case ENOSPC:
    case EDQUOT:
      return "cannot write: no space left on the device";
    case EFBIG:
      return "cannot write: file too large for this file system";
    case EROFS:
      return "cannot write: read-only file system";
    case ENOTDIR:
      return "cannot write: a part of the path is not a directory";
    case EISDIR:
      return "cannot write: is a directory";
    case ENAMETOOLONG:
      return "cannot write: name too long";
    default:
      return "cannot write: input/output error";
  }
}

OutputFile::~OutputFile() { Discard(); }

bool OutputFile::Create(const std::string& path, std::string* error) {
  mode_t mode;
  if (!ResolveTarget(path, &target_, &mode, error)) return false;
  const size_t slash = target_.find_last_of('/');
  const std::string directory = slash == std::string::npos ? "" : target_.substr(0, slash + 1);
  const std::string name = target_.substr(slash == std::string::npos ? 0 : slash + 1);
  if (name.empty()) {
    *error = WriteErrorText(EISDIR);
    return false;
  }
  // Shortened so that a name at the file system's limit still gets one.
  std::string pattern = directory + "." + name.substr(0, 200) + ".XXXXXX";
  fd_ = mkostemp(&pattern[0], O_CLOEXEC);
  if (fd_ < 0) {
    *error = WriteErrorText(errno);
    return false;
  }
  temporary_ = pattern;
  fchmod(fd_, mode);
  return true;
}

bool OutputFile::Commit(std::string* error) {
  const bool synced = fsync(fd_) == 0;
  const int sync_errno = errno;
  const bool closed = close(fd_) == 0;
  fd_ = -1;
  if (!synced || !closed) {
    *error = WriteErrorText(synced ? errno : sync_errno);
    Discard();
    return false;
  }
  if (rename(temporary_.c_str(), target_.c_str()) != 0) {
    *error = WriteErrorText(errno);
    Discard();
    return false;
  }
  temporary_.clear();
  return true;
}

void OutputFile::Discard() {
  if (fd_ >= 0) close(fd_);
  fd_ = -1;
  if (!temporary_.empty()) unlink(temporary_.c_str());
  temporary_.clear();
}

}  // namespace cwtool
