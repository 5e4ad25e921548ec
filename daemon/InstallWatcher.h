// Watches the installs of packages that were sent: how far each is, and how it ends.
#pragma once

#include <cstdint>
#include <memory>

#include "daemon/PendingInstalls.h"
#include "device/Device.h"
#include "host/InterruptSignals.h"
#include "host/SyncProgress.h"

namespace appsync::daemon {

/// Tells the progress how far each install is, and of each end, as the device's way of installing lets it know. One
/// object, one sync; destruction ends the watch. Threads: any.
class InstallWatcher {
 public:
  virtual ~InstallWatcher() = default;

  /// To be called in front of the package's hand-over.
  virtual void watch(SentPackage package) = 0;
  /// Blocks until another package of that size may lie on the device beside those whose install is not over, or the
  /// user interrupts.
  virtual void waitForRoom(std::uint64_t bytes) = 0;
  /// Blocks until what goes on by itself is over, well or not: the removals that were begun, and the installs for which
  /// an earlier sync that was killed had brought everything.
  virtual void waitForOthers() = 0;
  /// To be called once all packages are handed over and the client has ended the transfers: blocks until every install
  /// has its outcome.
  virtual void waitForInstalls() = 0;
};

/// For a device that installs directly. All must outlive it, as for the next.
[[nodiscard]] std::unique_ptr<InstallWatcher> makeDirectInstallWatcher(device::Device& device,
                                                                       host::SyncProgress& progress,
                                                                       const host::Interruption& interruption);
/// For a device that installs through coordinators.
[[nodiscard]] std::unique_ptr<InstallWatcher> makeCoordinatedInstallWatcher(device::Device& device,
                                                                            host::SyncProgress& progress,
                                                                            const host::Interruption& interruption);

}  // namespace appsync::daemon
