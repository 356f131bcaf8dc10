#include "tools/text_file.h"

#include <cerrno>
#include <cstdio>
#include <cstring>

namespace cwtool {

bool WriteTextFile(const std::string& path, const std::string& text,
                   std::string* error) {
  FILE* file = fopen(path.c_str(), "w");
  if (file == nullptr) {
    *error = std::string("cannot write: ") + std::strerror(errno);
    return false;
  }
  const bool written = fwrite(text.data(), 1, text.size(), file) == text.size();
  const int saved_errno = errno;
  if (fclose(file) != 0 || !written) {
    *error = std::string("cannot write: ") + std::strerror(written ? errno : saved_errno);
    return false;
  }
  return true;
}

}  // namespace cwtool
