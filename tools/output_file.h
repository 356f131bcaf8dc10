// A file that appears under its name only once it is complete: the data
// go to a hidden temporary file in the target's directory, which is renamed
// onto the name by Commit() and removed if the object goes without it.
#ifndef CLIPWEAVER_TOOLS_OUTPUT_FILE_H_
#define CLIPWEAVER_TOOLS_OUTPUT_FILE_H_

#include <string>

namespace cwtool {

class OutputFile {
 public:
  OutputFile() = default;
  ~OutputFile();
  OutputFile(const OutputFile&) = delete;
  OutputFile& operator=(const OutputFile&) = delete;

  // On failure *error says why in a few words.
  bool Create(const std::string& path, std::string* error);
  int fd() const { return fd_; }
  bool Commit(std::string* error);

 private:
  void Discard();

  std::string target_;
  std::string temporary_;
  int fd_ = -1;
};

// "cannot write: " and the reason, in our words.
std::string WriteErrorText(int errno_value);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_OUTPUT_FILE_H_
