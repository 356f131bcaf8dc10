// Writing a generated document (plot, page), whole or piece by piece as it
// is made, so that a large one need not be held in memory.
#ifndef CLIPWEAVER_TOOLS_TEXT_FILE_H_
#define CLIPWEAVER_TOOLS_TEXT_FILE_H_

#include <string>
#include <string_view>

#include "tools/output_file.h"

namespace cwtool {

class TextFile {
 public:
  bool Create(const std::string& path, std::string* error);
  // The first failure is kept for Commit(); nothing is written after it.
  void Write(std::string_view piece);
  // On failure *error reads "cannot write: <reason>".
  bool Commit(std::string* error);

 private:
  void Flush();
  void Put(std::string_view bytes);

  OutputFile file_;
  std::string buffer_;
  int errno_ = 0;
};

// On failure *error reads "cannot write: <reason>".
bool WriteTextFile(const std::string& path, const std::string& text,
                   std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_TEXT_FILE_H_
