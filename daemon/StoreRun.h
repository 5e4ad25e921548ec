// What the device's store brings during a sync.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "daemon/InstallWatcher.h"
#include "device/Device.h"
#include "device/coordination/StoreClient.h"
#include "host/HostState.h"
#include "host/InterruptSignals.h"
#include "host/Library.h"
#include "host/SyncPlan.h"
#include "host/SyncProgress.h"

namespace appsync::daemon {

/// The apps whose packages are the store's to bring.
[[nodiscard]] host::IdentifierSet awaitedFromStore(device::Device& device);

/// Runs the store for the apps that are planned to come from there, from its construction on, and tells the progress of
/// each that does not come; of those that do the watcher hears. One object, one sync.
class StoreRun {
 public:
  /// All must outlive it.
  StoreRun(device::Device& device, const std::vector<host::PlannedApp>& plan, host::SyncProgress& progress,
           InstallWatcher& watcher, const host::Interruption& interruption);

  /// Blocks until all packages have been delivered, or will not be now.
  void wait();

 private:
  [[nodiscard]] Result<std::string> find(std::string_view identifier) const;
  void report(const device::StoreDelivery& delivery);
  [[nodiscard]] host::AppName nameOf(const device::StoreDelivery& delivery) const;

  host::SyncProgress& progress_;
  InstallWatcher& watcher_;
  const host::Interruption& interruption_;
  host::IdentifierSet planned_;
  std::optional<std::string> folder_;
  std::optional<Result<host::Library>> store_;
  /// Null when there is nothing to bring.
  std::unique_ptr<device::StoreClient> client_;
};

}  // namespace appsync::daemon
