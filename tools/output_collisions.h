// The refusal, before any work, of an output that would overwrite an input
// or another output of the same run.
#ifndef CLIPWEAVER_TOOLS_OUTPUT_COLLISIONS_H_
#define CLIPWEAVER_TOOLS_OUTPUT_COLLISIONS_H_

#include <string>
#include <vector>

namespace cwtool {

struct PlannedOutput {
  std::string path;
  std::string role;  // "output", "--click output", ...
};

// Empty when every output is a file of its own; else one line naming the
// two. Files that exist are compared by device and inode (which sees hard
// links and symbolic links), the others by their resolved path.
std::string FindCollision(const std::vector<std::string>& inputs,
                          const std::vector<PlannedOutput>& outputs);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_OUTPUT_COLLISIONS_H_
