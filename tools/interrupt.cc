#include "tools/interrupt.h"

#include <signal.h>

namespace cwtool {
namespace {

std::atomic<bool> interrupted{false};
static_assert(std::atomic<bool>::is_always_lock_free,
              "the signal handler needs a lock-free flag");

void OnInterrupt(int) { interrupted.store(true); }

}  // namespace

void InstallInterruptHandler() {
  struct sigaction action {};
  action.sa_handler = OnInterrupt;
  sigemptyset(&action.sa_mask);
  // libsndfile does not retry on EINTR; every wait here is on a regular
  // file, so restarting loses no promptness.
  action.sa_flags = SA_RESTART;
  sigaction(SIGINT, &action, nullptr);
}

const std::atomic<bool>& InterruptFlag() { return interrupted; }

}  // namespace cwtool
