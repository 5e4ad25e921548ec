// The process that sets up a restored device.
#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "base/Error.h"
#include "device/Device.h"
#include "host/Backup.h"
#include "host/SyncProgress.h"
#include "platform/ZTClient.h"

namespace appsync::daemon {

/// Has the sync client create the placeholders of restored apps. The packages arrive with the next sync.
class DataMigrator {
 public:
  /// Loads the plug-in into the data migrator's process: outside the daemon the plug-in itself waits for the
  /// placeholders. Fails if the plug-in cannot be used. `device` must outlive the migrator.
  [[nodiscard]] static Result<DataMigrator> make(device::Device& device);

  /// Creates the placeholders of `apps`, whose files are in place, and applies the backup's icon order. Blocks until
  /// each app is reported as restored or failed.
  void createPlaceholders(const host::Backup& backup, const std::vector<const host::BackedUpApp*>& apps,
                          host::SyncProgress& progress);

 private:
  DataMigrator(device::Device& device, std::shared_ptr<platform::ZTClient> client)
      : device_(device), client_(std::move(client)) {}

  void reconcileRestore(const std::vector<const host::BackedUpApp*>& apps, host::SyncProgress& progress);
  [[nodiscard]] Status finishApp(const host::BackedUpApp& app);
  [[nodiscard]] Status demote(const host::BackedUpApp& app, const platform::AppRecord& record);
  void applyIconOrder(const std::vector<std::string>& order);

  device::Device& device_;
  std::shared_ptr<platform::ZTClient> client_;
};

}  // namespace appsync::daemon
