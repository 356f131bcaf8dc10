// Writing a generated document (plot, page) in one go.
#ifndef CLIPWEAVER_TOOLS_TEXT_FILE_H_
#define CLIPWEAVER_TOOLS_TEXT_FILE_H_

#include <string>

namespace cwtool {

// On failure *error reads "cannot write: <reason>".
bool WriteTextFile(const std::string& path, const std::string& text,
                   std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_TEXT_FILE_H_
