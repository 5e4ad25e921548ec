// What the device's store brings during a sync.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "device/Device.h"
#include "device/StoreClient.h"
#include "tools/HostState.h"
#include "tools/InstallWatcher.h"
#include "tools/Interruption.h"
#include "tools/Library.h"
#include "tools/SyncPlan.h"
#include "tools/SyncProgress.h"

namespace appsync::tools {

/// The apps whose packages are the store's to bring.
[[nodiscard]] IdentifierSet awaitedFromStore(device::Device& device);

/// Runs the store for the apps that are planned to come from there, from its construction on, and tells the progress of
/// each that does not come; of those that do the watcher hears. One object, one sync.
class StoreRun {
 public:
  /// All must outlive it.
  StoreRun(device::Device& device, const std::vector<PlannedApp>& plan, SyncProgress& progress, InstallWatcher& watcher,
           const Interruption& interruption);

  /// Blocks until all packages have been delivered, or will not be now.
  void wait();

 private:
  [[nodiscard]] Result<std::string> find(std::string_view identifier) const;
  void report(const device::StoreDelivery& delivery);
  [[nodiscard]] AppName nameOf(const device::StoreDelivery& delivery) const;

  SyncProgress& progress_;
  InstallWatcher& watcher_;
  const Interruption& interruption_;
  IdentifierSet planned_;
  std::optional<std::string> folder_;
  std::optional<Result<Library>> store_;
  /// Null when there is nothing to bring.
  std::unique_ptr<device::StoreClient> client_;
};

}  // namespace appsync::tools
