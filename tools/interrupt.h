// Ctrl-C as a request to stop: the first SIGINT sets a flag that the
// analysis polls through its progress callback; a second one ends the
// process at once.
#ifndef CLIPWEAVER_TOOLS_INTERRUPT_H_
#define CLIPWEAVER_TOOLS_INTERRUPT_H_

#include <atomic>

namespace cwtool {

void InstallInterruptHandler();
const std::atomic<bool>& InterruptFlag();

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_INTERRUPT_H_
