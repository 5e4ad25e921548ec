// Fault injection for tests of the device.
#pragma once

#include <atomic>
#include <cerrno>

#include "device/storage/FaultPoint.h"

namespace appsync::test {

/// Installs a hook during its lifetime.
class InstalledFaultHook {
 public:
  explicit InstalledFaultHook(device::FaultHook hook) { device::setFaultHook(hook); }
  ~InstalledFaultHook() { device::setFaultHook(nullptr); }
  InstalledFaultHook(const InstalledFaultHook&) = delete;
  InstalledFaultHook& operator=(const InstalledFaultHook&) = delete;
};

/// Returns the result of `work`, which runs with `hook` installed.
template <class Work>
auto withFaultHook(device::FaultHook hook, const Work& work) {
  const InstalledFaultHook installed(hook);
  return work();
}

/// During its lifetime, makes a fault point, counted from 1, fail with ENOSPC, and all later ones if `extent` says so.
class InjectedFault {
 public:
  enum class Extent { one, allLater };

  explicit InjectedFault(long faultPoint, Extent extent = Extent::one)
      : hook_((remaining_ = faultPoint, extent == Extent::one ? failOne : failAllLater)) {}

  /// Returns whether the latest fault was injected.
  [[nodiscard]] static bool wasInjected() { return remaining_ < 1; }

 private:
  static int failOne(const char*) { return remaining_.fetch_sub(1) == 1 ? ENOSPC : 0; }
  static int failAllLater(const char*) { return remaining_.fetch_sub(1) <= 1 ? ENOSPC : 0; }

  static inline std::atomic<long> remaining_ = 0;
  InstalledFaultHook hook_;
};

}  // namespace appsync::test
