#include "tools/text_file.h"

#include <unistd.h>

#include <cerrno>

#include "tools/output_file.h"

namespace cwtool {

bool WriteTextFile(const std::string& path, const std::string& text,
                   std::string* error) {
  OutputFile file;
  if (!file.Create(path, error)) return false;
  for (size_t done = 0; done < text.size();) {
    const ssize_t wrote = write(file.fd(), text.data() + done, text.size() - done);
    if (wrote < 0 && errno == EINTR) continue;
    if (wrote <= 0) {
      *error = WriteErrorText(errno);
      return false;
    }
    done += static_cast<size_t>(wrote);
  }
  return file.Commit(error);
}

}  // namespace cwtool
