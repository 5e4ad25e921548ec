// Brings a backup back to a device.
#pragma once

#include <set>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/Device.h"
#include "host/Backup.h"
#include "host/SyncProgress.h"
#include "platform/ZTClient.h"
#include "plist/PropertyList.h"

namespace appsync::host {

/// The host and the process that sets a restored device up, for one restore: puts the apps' data and the files that the
/// sync client reads in place, lets it make the placeholders, and waits for them for the bounded time that it takes.
/// Packages come with the next sync.
///
/// Cut off at any moment, the restore of the same backup is taken up again; the device remembers which one it is.
class Restore {
 public:
  /// All must outlive it. `client` is not the daemon's: it waits for placeholders.
  Restore(device::Device& device, const Backup& backup, platform::ZTClient& client, SyncProgress& progress)
      : device_(device), backup_(backup), client_(client), progress_(progress) {}

  /// Whether the device can be restored: it has no apps, or a restore of this backup was cut off on it.
  [[nodiscard]] Status check() const;

  /// Every app of the backup has its outcome in the progress when it returns; fails when nothing can be restored at
  /// all, and is to be run again then.
  [[nodiscard]] Status run();

 private:
  [[nodiscard]] Status putFilesInPlace();
  void makePlaceholders();
  void finishApps();
  [[nodiscard]] Status takeOver(const BackedUpApp& app, plist::Dictionary& entries);
  [[nodiscard]] Status keepData(const BackedUpApp& app);
  [[nodiscard]] Status demote(const BackedUpApp& app, const platform::AppRecord& record);
  [[nodiscard]] bool isWanted(const BackedUpApp& app) const { return !refused_.contains(app.app.identifier); }
  void refuse(const BackedUpApp& app, std::string_view reason);

  device::Device& device_;
  const Backup& backup_;
  platform::ZTClient& client_;
  SyncProgress& progress_;
  std::set<std::string, std::less<>> refused_;
};

}  // namespace appsync::host
