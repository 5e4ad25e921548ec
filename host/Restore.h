// The host's part of a restore: the files and the data of a backup, put in place on a device.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "device/Device.h"
#include "host/Backup.h"
#include "host/HostState.h"
#include "host/SyncProgress.h"
#include "plist/PropertyList.h"

namespace appsync::host {

/// One restore of one backup: `check`, `begin`, then the data migrator, then `end`. The device's folder stores the
/// backup's identifier in "restore.plist" from `begin` to `end`, so that an interrupted restore can be resumed: all
/// steps are idempotent. Not thread-safe.
class Restore {
 public:
  /// All arguments must outlive it.
  Restore(device::Device& device, const Backup& backup, SyncProgress& progress)
      : device_(device), backup_(backup), progress_(progress) {}

  /// Fails unless the device has no apps or has an unfinished restore of this backup.
  [[nodiscard]] Status check() const;

  /// Puts the apps' data and the files that the sync client reads in place. An app whose part of the backup is damaged
  /// is reported as failed. If the files cannot be written, every app is, and the restore must be run again.
  [[nodiscard]] Status begin();

  /// Returns the apps whose files are in place, in the backup's order.
  [[nodiscard]] std::vector<const BackedUpApp*> preparedApps() const;

  /// Marks the restore as finished.
  [[nodiscard]] Status end();

 private:
  [[nodiscard]] std::optional<std::string> unfinishedBackup() const;
  [[nodiscard]] Status saveMarker();
  [[nodiscard]] Status putFilesInPlace();
  [[nodiscard]] Status prepare(const BackedUpApp& app, plist::Dictionary& entries);
  [[nodiscard]] Status keepData(const BackedUpApp& app);
  [[nodiscard]] bool isRefused(const BackedUpApp& app) const { return refused_.contains(app.name.identifier); }
  void refuse(const BackedUpApp& app, std::string_view reason);
  [[nodiscard]] std::string markerPath() const { return device_.path() + "/restore.plist"; }

  device::Device& device_;
  const Backup& backup_;
  SyncProgress& progress_;
  IdentifierSet refused_;
};

}  // namespace appsync::host
