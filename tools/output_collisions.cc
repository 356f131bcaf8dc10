#include "tools/output_collisions.h"

#include <limits.h>
#include <stdlib.h>
#include <sys/stat.h>

#include <map>

#include "tools/text_escape.h"

namespace cwtool {
namespace {

std::string Identity(const std::string& path) {
  struct stat status;
  if (stat(path.c_str(), &status) == 0) {
    return "inode " + std::to_string(status.st_dev) + ":" + std::to_string(status.st_ino);
  }
  // Not there yet: its directory resolved, and its name.
  const size_t slash = path.find_last_of('/');
  const std::string directory =
      slash == std::string::npos ? "." : slash == 0 ? "/" : path.substr(0, slash);
  const std::string name = slash == std::string::npos ? path : path.substr(slash + 1);
  char resolved[PATH_MAX];
  if (realpath(directory.c_str(), resolved) == nullptr) return "path " + path;
  return "path " + std::string(resolved) + "/" + name;
}

std::string Quoted(const std::string& path) { return "'" + TerminalText(path) + "'"; }

}  // namespace

std::string FindCollision(const std::vector<std::string>& inputs,
                          const std::vector<PlannedOutput>& outputs) {
  std::map<std::string, std::string> inputs_by_identity;
  for (const std::string& input : inputs) inputs_by_identity.emplace(Identity(input), input);
  std::map<std::string, const PlannedOutput*> outputs_by_identity;
  for (const PlannedOutput& output : outputs) {
    const std::string identity = Identity(output.path);
    const auto input = inputs_by_identity.find(identity);
    if (input != inputs_by_identity.end()) {
      return output.role + " " + Quoted(output.path) + " is the same file as input " +
             Quoted(input->second) + "; nothing written";
    }
    const auto earlier = outputs_by_identity.emplace(identity, &output);
    if (!earlier.second) {
      const PlannedOutput& other = *earlier.first->second;
      return output.role + " " + Quoted(output.path) + " is the same file as " +
             other.role + " " + Quoted(other.path) + "; nothing written";
    }
  }
  return std::string();
}

}  // namespace cwtool
