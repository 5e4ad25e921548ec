#include "host/InterruptSignals.h"

#include <array>
#include <atomic>
#include <csignal>

namespace appsync::host {
namespace {

constexpr std::array<int, 3> kSignals = {SIGINT, SIGTERM, SIGHUP};

std::atomic<bool> wasRequested = false;
static_assert(std::atomic<bool>::is_always_lock_free, "used in a signal handler");

/// Calls async-signal-safe functions only.
void handle(int signal) {
  if (wasRequested.exchange(true)) {
    std::signal(signal, SIG_DFL);
    std::raise(signal);
    return;
  }
}

}  // namespace

InterruptSignals::InterruptSignals() {
  wasRequested = false;
  struct sigaction action = {};
  action.sa_handler = handle;
  action.sa_flags = SA_RESTART | SA_NODEFER;
  sigemptyset(&action.sa_mask);
  for (const int signal : kSignals) {
    struct sigaction earlier = {};
    // A signal that the parent process has set to be ignored, as nohup does, stays ignored.
    ::sigaction(signal, nullptr, &earlier);
    if (earlier.sa_handler != SIG_IGN) ::sigaction(signal, &action, nullptr);
  }
}

InterruptSignals::~InterruptSignals() {
  for (const int signal : kSignals) {
    struct sigaction present = {};
    ::sigaction(signal, nullptr, &present);
    if (present.sa_handler == handle) std::signal(signal, SIG_DFL);
  }
}

bool InterruptSignals::requested() const {
  return wasRequested;
}

}  // namespace appsync::host
