// Watches the installs of sent packages.
#pragma once

#include <cstdint>
#include <memory>

#include "daemon/PendingInstalls.h"
#include "device/Device.h"
#include "host/InterruptSignals.h"
#include "host/SyncProgress.h"

namespace appsync::daemon {

/// Reports the progress and the outcome of each install. One object serves one sync; the destructor ends the watch.
/// Thread-safe.
class InstallWatcher {
 public:
  virtual ~InstallWatcher() = default;

  /// Adds a package. Must be called before the package is passed to the client.
  virtual void watch(PendingInstall package) = 0;
  /// Blocks until the packages on the device whose installs have not ended leave space for `bytes` more, or the user
  /// interrupts.
  virtual void waitForSpace(std::uint64_t bytes) = 0;
  /// Blocks until operations that need nothing from this sync have ended: started removals, and installs whose packages
  /// were delivered by an earlier sync that crashed.
  virtual void waitForOthers() = 0;
  /// Blocks until every install has its outcome. Must be called after the last package was passed on and the client was
  /// notified of the end of the transfers.
  virtual void waitForInstalls() = 0;
};

/// Returns the watcher for a device that installs directly. All arguments must outlive it.
[[nodiscard]] std::unique_ptr<InstallWatcher> makeDirectInstallWatcher(device::Device& device,
                                                                       host::SyncProgress& progress,
                                                                       const host::InterruptSignals& interruption);
/// Returns the watcher for a device that installs through coordinators. All arguments must outlive it.
[[nodiscard]] std::unique_ptr<InstallWatcher> makeCoordinatedInstallWatcher(device::Device& device,
                                                                            host::SyncProgress& progress,
                                                                            const host::InterruptSignals& interruption);

}  // namespace appsync::daemon
