// Fault injection: tests can stop or fail every operation that changes the device's files or database.
#pragma once

#include <atomic>

namespace appsync::device {

/// Called before each operation with its name, on any thread. Returns 0 to continue or the errno value with which the
/// operation fails. May terminate the process.
using FaultHook = int (*)(const char* name);

namespace detail {
inline std::atomic<FaultHook> faultHook{nullptr};
}

/// Installs a hook, or removes it if `hook` is null.
inline void setFaultHook(FaultHook hook) {
  detail::faultHook.store(hook, std::memory_order_release);
}

/// Must be called before an operation. If the result is not 0, the operation must fail with that errno value without
/// having any effect.
[[nodiscard]] inline int faultPoint(const char* name) {
  const FaultHook hook = detail::faultHook.load(std::memory_order_acquire);
  return hook == nullptr ? 0 : hook(name);
}

/// If the environment variable APPSYNC_KILL_AT is N, installs a hook that kills the process before its N-th operation,
/// counted from 1. Does nothing if a hook is installed already.
void installKillHookFromEnvironment();

}  // namespace appsync::device
