// Bringing the store metadata of installed apps up to date before the device is backed up.
#include "common/PropertyListFile.h"
#include "core/AppsClient.h"
#include "plist/Access.h"
#include "reporting/UserApps.h"

namespace appsync {

namespace {

using platform::AppRecord;

enum class Change { none, made };

/// Whether the app's licence is bound to this device, which a backup must say if it ever did.
Change updateLicenceState(plist::Dictionary& metadata, const AppRecord& app, const PlugInLog& log) {
  constexpr std::string_view kKey = "DeviceBasedKLP";
  const bool isDeviceBased = app.hasMIDBasedSINF();
  if (!metadata.contains(kKey) && !isDeviceBased) return Change::none;
  metadata.set(kKey, isDeviceBased);
  log.message("%s|Updated DeviceBasedKLP state for : %{public}@ to %d", app.applicationIdentifier(), isDeviceBased);
  return Change::made;
}

/// A backup must not have the device that it is restored to download apps of itself.
Change clearAutomaticDownload(plist::Dictionary& metadata, const AppRecord& app, const PlugInLog& log) {
  constexpr std::string_view kKey = "is-auto-download";
  if (!booleanIn(std::as_const(metadata).find(kKey))) return Change::none;
  metadata.erase(kKey);
  log.message("%s|clearing is-auto-download value for %{public}@", app.applicationIdentifier());
  return Change::made;
}

void prepareApp(platform::FileSystem& files, const AppRecord& app, const PlugInLog& log) {
  const auto path = storeMetadataPath(app);
  plist::Value root = readDictionary(files, path);
  plist::Dictionary* metadata = root.dictionary();
  if (metadata == nullptr) return;
  const Change licence = updateLicenceState(*metadata, app, log);
  const Change download = clearAutomaticDownload(*metadata, app, log);
  if (licence == Change::made || download == Change::made) writePropertyList(files, *path, root).ignore();
}

}  // namespace

void AppsClient::prepareForBackup() {
  _log.message("%s|preparing for backup");
  visitUserApps(_platform.defaultRegistry(),
                [this](const AppRecord& app) { prepareApp(_platform.fileSystem(), app, _log); });
  _log.message("%s|finished preparing for backup");
}

}  // namespace appsync
