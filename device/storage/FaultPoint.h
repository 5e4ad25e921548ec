// Where a test may stop the device: in front of every step that changes its files or its database.
#pragma once

#include <atomic>

namespace appsync::device {

/// Called in front of each step with its name; answers 0 to go on, or the error number the step is to fail with. May
/// end the process. Any thread.
using FaultHook = int (*)(const char* name);

namespace detail {
inline std::atomic<FaultHook> faultHook{nullptr};
}

/// Puts a hook in place; null takes it out again.
inline void setFaultHook(FaultHook hook) {
  detail::faultHook.store(hook, std::memory_order_release);
}

/// To be called in front of a step. Anything but 0 is the error number that the step fails with, undone.
[[nodiscard]] inline int faultPoint(const char* name) {
  const FaultHook hook = detail::faultHook.load(std::memory_order_acquire);
  return hook == nullptr ? 0 : hook(name);
}

/// When the environment says APPSYNC_KILL_AT=N, puts a hook in place that kills the process in front of its N-th step,
/// counted from 1. Without it, or with a hook in place already, does nothing.
void installKillHookFromEnvironment();

}  // namespace appsync::device
