#include "device/storage/FaultPoint.h"

#include <csignal>
#include <cstdlib>

namespace appsync::device {

namespace {

std::atomic<long> faultPointsUntilKill{0};

int killWhenDue(const char*) {
  if (faultPointsUntilKill.fetch_sub(1, std::memory_order_relaxed) == 1) {
    std::raise(SIGKILL);
  }
  return 0;
}

}  // namespace

void installKillHookFromEnvironment() {
  const char* text = std::getenv("APPSYNC_KILL_AT");
  if (text == nullptr || detail::faultHook.load() != nullptr) return;
  const long number = std::strtol(text, nullptr, 10);
  if (number < 1) return;
  faultPointsUntilKill = number;
  setFaultHook(killWhenDue);
}

}  // namespace appsync::device
