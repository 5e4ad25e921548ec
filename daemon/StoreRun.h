// The deliveries of the device's store during a sync.
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

/// Returns the apps whose packages the store is to deliver.
[[nodiscard]] host::IdentifierSet awaitedFromStore(device::Device& device);

/// Runs the store for the planned restores, from construction on. Passes delivered packages to the watcher and reports
/// failed deliveries. One object serves one sync.
class StoreRun {
 public:
  /// All arguments must outlive it.
  StoreRun(device::Device& device, const std::vector<host::PlannedApp>& plan, host::SyncProgress& progress,
           InstallWatcher& watcher, const host::InterruptSignals& interruption);

  /// Blocks until every package was delivered or failed.
  void wait();

 private:
  [[nodiscard]] Result<std::string> find(std::string_view identifier) const;
  void report(const device::StoreDelivery& delivery);
  [[nodiscard]] host::AppName nameOf(const device::StoreDelivery& delivery) const;

  host::SyncProgress& progress_;
  InstallWatcher& watcher_;
  const host::InterruptSignals& interruption_;
  host::IdentifierSet planned_;
  std::optional<std::string> folder_;
  std::optional<Result<host::Library>> store_;
  /// Null if nothing is to be delivered.
  std::unique_ptr<device::StoreClient> client_;
};

}  // namespace appsync::daemon
