#include "host/Restore.h"

#include <cerrno>
#include <utility>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/apps/AppData.h"
#include "device/apps/BackupManager.h"
#include "device/apps/Demotion.h"
#include "device/storage/HostFile.h"
#include "device/storage/SystemCalls.h"
#include "host/DeviceApps.h"
#include "host/RestoreInfo.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync::host {
namespace {

using platform::TSInstallType;

constexpr std::string_view kHostRestoreFolder = "/var/mobile/Media/HarvoRestore";
constexpr std::string_view kBackupKey = "Backup";

Error refusal(std::string text) {
  return {std::string(domains::kPOSIX), EEXIST, std::move(text), nullptr};
}

Status writeList(device::Device& device, std::string_view path, const plist::Value& root) {
  const Result<Bytes> document = plist::writeBinary(root);
  return document ? device.platform().fileSystem().writeFileAtomically(path, *document) : Status(document.error());
}

}  // namespace

Status Restore::check() const {
  const auto unfinished = unfinishedBackup();
  if (unfinished == backup_.identifier) return {};
  const Result<std::vector<DeviceApp>> apps = appsOn(device_);
  if (!apps) return apps.error();
  if (apps->empty()) return {};
  if (unfinished) {
    return refusal(device_.path() +
                   " has an unfinished restore of another backup; finish that restore first, or restore to a new "
                   "device, made with `appsync init`");
  }
  return refusal(device_.path() + " already has apps; restore to a new device, made with `appsync init`");
}

Status Restore::begin() {
  for (const BackedUpApp& app : backup_.apps) {
    if (app.damage.empty()) {
      progress_.expect(app.name, 0);
    } else {
      refuse(app, app.damage);
    }
  }
  Status placed = saveMarker();
  if (placed) placed = putFilesInPlace();
  if (placed) return {};
  for (const BackedUpApp& app : backup_.apps)
    progress_.finish({AppEvent::failed, app.name, placed.error().text});
  return placed;
}

std::vector<const BackedUpApp*> Restore::preparedApps() const {
  std::vector<const BackedUpApp*> apps;
  for (const BackedUpApp& app : backup_.apps) {
    if (!isRefused(app)) apps.push_back(&app);
  }
  return apps;
}

Status Restore::end() {
  const int error = device::sys::removeFile(AT_FDCWD, markerPath().c_str());
  return error == 0 || error == ENOENT ? Status() : Status(Error::fromErrno(error, markerPath()));
}

std::optional<std::string> Restore::unfinishedBackup() const {
  const Result<Bytes> bytes = device::readHostFile(markerPath());
  if (!bytes) return std::nullopt;
  const Result<plist::Value> root = plist::read(*bytes);
  return root ? plist::ownedStringIn(root->find(kBackupKey)) : std::nullopt;
}

Status Restore::saveMarker() {
  const Result<Bytes> bytes = plist::writeXML(plist::Dictionary{{kBackupKey, backup_.identifier}});
  return bytes ? device::replaceHostFile(markerPath(), *bytes) : Status(bytes.error());
}

Status Restore::putFilesInPlace() {
  plist::Dictionary entries;
  plist::Array automatic;
  plist::Array intentional;
  for (const BackedUpApp& app : backup_.apps) {
    if (isRefused(app)) continue;
    if (Status prepared = prepare(app, entries); !prepared) {
      refuse(app, prepared.error().text);
      continue;
    }
    if (!app.isDemoted()) continue;
    (app.demotion == TSInstallType::Downgrade ? automatic : intentional).push_back(app.name.identifier);
  }
  const plist::Dictionary demoted = {{demoted_apps::kAutomaticKey, std::move(automatic)},
                                     {demoted_apps::kIntentionalKey, std::move(intentional)}};
  RETURN_IF_ERROR(writeList(device_, kDemotedAppsPath, demoted));
  RETURN_IF_ERROR(device_.platform().fileSystem().createDirectory(kHostRestoreFolder,
                                                                  platform::IntermediateDirectories::create, {}));
  return writeList(device_, kRestoreApplicationsPath, entries);
}

Status Restore::prepare(const BackedUpApp& app, plist::Dictionary& entries) {
  Result<plist::Dictionary> entry = restoreInfoOf(backup_, app);
  if (!entry) return entry.error();
  RETURN_IF_ERROR(keepData(app));
  entries.set(app.name.identifier, std::move(entry).value());
  return {};
}

Status Restore::keepData(const BackedUpApp& app) {
  const std::string& identifier = app.name.identifier;
  if (!app.data) return {};
  device::BackupManager manager(device_.services().database(), device_.services().fileSystem());
  std::uint64_t size = 0;
  const bool isKept = manager.restoreDataExists(identifier, &size);
  // An interrupted attempt may already have moved the data to the app.
  if (!isKept && device_.platform().fileSystem().fileExists(device::dataContainerOf(identifier))) return {};
  if (isKept && size == *app.data) return {};
  RETURN_IF_ERROR(manager.keepRestoreData(identifier, dataFolderIn(backup_, app)));
  if (manager.restoreDataExists(identifier, &size) && size == *app.data) return {};
  manager.cancelApplicationRestore(identifier, nullptr);
  return Error{std::string(domains::kPOSIX), EINVAL,
               "its data in the backup is damaged: it has " + std::to_string(size) + " bytes and must have " +
                   std::to_string(*app.data),
               nullptr};
}

void Restore::refuse(const BackedUpApp& app, std::string_view reason) {
  refused_.insert(app.name.identifier);
  progress_.finish({AppEvent::failed, app.name, std::string(reason)});
}

}  // namespace appsync::host
