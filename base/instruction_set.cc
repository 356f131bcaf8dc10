#include "base/instruction_set.h"

#include <cstdlib>

namespace instruction_set {

bool HasAvx() {
#if defined(__x86_64__) && defined(__GNUC__)
  // Initialised here too: the library may be called from another
  // library's constructor, before libgcc has looked at the processor.
  static const bool has_avx = (__builtin_cpu_init(), __builtin_cpu_supports("avx")) &&
                              std::getenv("CLIPWEAVER_NO_AVX") == nullptr;
  return has_avx;
#else
  return false;
#endif
}

}  // namespace instruction_set
