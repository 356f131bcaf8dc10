// A generated document (plot, page) written piece by piece as it is made,
// so that a large one is never held in memory.
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

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_TEXT_FILE_H_
