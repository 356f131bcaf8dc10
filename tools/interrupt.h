// Ctrl-C as a request to stop: SIGINT sets a flag that every phase polls
// between blocks (the analysis through its progress callback). The phase
// then ends, removes what it had half written, and the tool exits with 130.
// A second Ctrl-C does not kill the process, as that would leave partial
// files behind; the first is answered within a block anyway.
#ifndef CLIPWEAVER_TOOLS_INTERRUPT_H_
#define CLIPWEAVER_TOOLS_INTERRUPT_H_

#include <atomic>

namespace cwtool {

void InstallInterruptHandler();
const std::atomic<bool>& InterruptFlag();
inline bool Interrupted() { return InterruptFlag().load(); }

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_INTERRUPT_H_
