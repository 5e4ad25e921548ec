#include "host/Restore.h"

#include <cerrno>
#include <chrono>
#include <memory>
#include <utility>

#include "base/ReturnIfError.h"
#include "device/apps/AppData.h"
#include "device/apps/BackupManager.h"
#include "device/apps/Demotion.h"
#include "host/DeviceApps.h"
#include "host/RestoreInfo.h"
#include "host/RestoreMarker.h"
#include "host/Ticker.h"

namespace appsync::host {
namespace {

using namespace std::chrono_literals;
using platform::TSInstallType;

constexpr std::string_view kHostRestoreFolder = "/var/mobile/Media/HarvoRestore";
constexpr std::string_view kHostRestorePath = "/var/mobile/Media/HarvoRestore/RestoreApplications.plist";
constexpr auto kTimeBetweenLooks = 20ms;

Error refusal(std::string text) {
  return {std::string(domains::kPOSIX), EEXIST, std::move(text), nullptr};
}

std::shared_ptr<const platform::AppRecord> recordOf(device::Device& device, std::string_view identifier) {
  return device.platform().defaultRegistry().recordForIdentifier(identifier, platform::PlaceholderLookup::on);
}

Status writeList(device::Device& device, std::string_view path, const plist::Value& root) {
  const Result<Bytes> document = plist::writeBinary(root);
  return document ? device.platform().fileSystem().writeFileAtomically(path, *document) : Status(document.error());
}

}  // namespace

Status Restore::check() const {
  const auto underWay = restoreUnderWay(device_.path());
  if (underWay == backup_.identifier) return {};
  const Result<std::vector<DeviceApp>> apps = appsOn(device_);
  if (!apps) return apps.error();
  if (apps->empty()) return {};
  if (underWay) {
    return refusal(device_.path() +
                   " is in the middle of the restore of another backup; finish that one first, or restore to a new "
                   "device, made with `appsync init`");
  }
  return refusal(device_.path() + " has apps already; restore to a new device, made with `appsync init`");
}

Status Restore::run() {
  for (const BackedUpApp& app : backup_.apps) {
    if (app.damage.empty()) {
      progress_.expect(app.app, 0);
    } else {
      refuse(app, app.damage);
    }
  }
  Status placed = beginRestore(device_.path(), backup_.identifier);
  if (placed) placed = putFilesInPlace();
  if (!placed) {
    for (const BackedUpApp& app : backup_.apps)
      progress_.finish({AppEvent::failed, app.app, placed.error().text});
    return placed;
  }
  makePlaceholders();
  finishApps();
  return endRestore(device_.path());
}

Status Restore::putFilesInPlace() {
  plist::Dictionary entries;
  plist::Array automatic;
  plist::Array intentional;
  for (const BackedUpApp& app : backup_.apps) {
    if (!isWanted(app)) continue;
    if (Status taken = takeOver(app, entries); !taken) {
      refuse(app, taken.error().text);
      continue;
    }
    if (!app.isDemoted()) continue;
    (app.demotion == TSInstallType::Downgrade ? automatic : intentional).push_back(app.app.identifier);
  }
  const plist::Dictionary demoted = {{device::kAutomaticDowngradesKey, std::move(automatic)},
                                     {device::kIntentionalDowngradesKey, std::move(intentional)}};
  RETURN_IF_ERROR(writeList(device_, device::kDemotedAppsPath, demoted));
  Status made = device_.platform().fileSystem().createDirectory(kHostRestoreFolder,
                                                                platform::IntermediateDirectories::create, {});
  return made ? writeList(device_, kHostRestorePath, entries) : made;
}

Status Restore::takeOver(const BackedUpApp& app, plist::Dictionary& entries) {
  Result<plist::Dictionary> entry = restoreInfoOf(backup_, app);
  if (!entry) return entry.error();
  RETURN_IF_ERROR(keepData(app));
  entries.set(app.app.identifier, std::move(entry).value());
  return {};
}

Status Restore::keepData(const BackedUpApp& app) {
  const std::string& identifier = app.app.identifier;
  if (!app.data) return {};
  device::BackupManager manager(device_.services().database(), device_.services().fileSystem());
  std::uint64_t size = 0;
  const bool isKept = manager.restoreDataExists(identifier, &size);
  // An attempt that was cut off may have come further.
  if (!isKept && device_.platform().fileSystem().fileExists(device::dataContainerOf(identifier))) return {};
  if (isKept && size == *app.data) return {};
  RETURN_IF_ERROR(manager.keepRestoreData(identifier, dataFolderIn(backup_, app)));
  if (manager.restoreDataExists(identifier, &size) && size == *app.data) return {};
  manager.cancelApplicationRestore(identifier, nullptr);
  return Error{std::string(domains::kPOSIX), EINVAL,
               "its data in the backup is damaged: there are " + std::to_string(size) + " bytes and must be " +
                   std::to_string(*app.data),
               nullptr};
}

void Restore::makePlaceholders() {
  const Ticker ticker(kTimeBetweenLooks, [this] {
    for (const BackedUpApp& app : backup_.apps) {
      if (recordOf(device_, app.app.identifier) != nullptr) progress_.installing(app.app.identifier, 1);
    }
  });
  client_.reconcileRestoreOfType(platform::kRestoreTypeHost, nullptr);
}

void Restore::finishApps() {
  for (const BackedUpApp& app : backup_.apps) {
    if (!isWanted(app)) continue;
    const auto record = recordOf(device_, app.app.identifier);
    if (record == nullptr) {
      refuse(app, "the device made no placeholder for it; --log may tell why");
    } else if (Status demoted = app.isDemoted() ? demote(app, *record) : Status(); !demoted) {
      refuse(app, demoted.error().text);
    } else {
      progress_.finish({AppEvent::restored, app.app, {}});
    }
  }
  const plist::Array layout(backup_.iconOrder.begin(), backup_.iconOrder.end());
  const Result<Bytes> document = plist::writeBinary(layout);
  auto& homeScreen = device_.services().homeScreen();
  if (document && !layout.empty()) homeScreen.setIconState(homeScreen.blockableServerPort(), *document);
}

/// Without coordination the sync client makes all placeholders alike. No package comes that would bring the app's own
/// name, where the store has another, nor one at which the data would be given back.
Status Restore::demote(const BackedUpApp& app, const platform::AppRecord& record) {
  const std::string& identifier = app.app.identifier;
  if (record.isPlaceholder() && !record.isInstalled()) {
    device::AppRegistry& registry = device_.services().defaultRegistry();
    Status set =
        record.installType() == app.demotion ? Status() : registry.setPlaceholderType(identifier, app.demotion);
    if (set && !app.app.name.empty()) set = registry.renamePlaceholder(identifier, app.app.name);
    if (!set) return set;
  }
  device::BackupManager manager(device_.services().database(), device_.services().fileSystem());
  return manager.restoreDataNow(identifier);
}

void Restore::refuse(const BackedUpApp& app, std::string_view reason) {
  refused_.insert(app.app.identifier);
  progress_.finish({AppEvent::failed, app.app, std::string(reason)});
}

}  // namespace appsync::host
