#include "daemon/Daemon.h"

#include <algorithm>
#include <chrono>
#include <utility>

#include "base/ReturnIfError.h"
#include "daemon/CoordinatorCleanup.h"
#include "daemon/control/Server.h"
#include "device/services/SyncFramework.h"
#include "host/StagingArea.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync::daemon {
namespace {

using platform::PlaceholderLookup;
using platform::RestrictionSetting;
using platform::RestrictionValue;
using platform::ZTAsset;

constexpr auto kShortestTimeBetweenUpdates = std::chrono::milliseconds(50);

using AppsByIdentifier = std::map<std::string, host::DeviceApp, std::less<>>;

Result<AppsByIdentifier> appsByIdentifier(device::Device& device) {
  Result<std::vector<host::DeviceApp>> all = host::appsOn(device);
  if (!all) return all.error();
  AppsByIdentifier apps;
  for (host::DeviceApp& app : *all)
    apps.emplace(app.name.identifier, std::move(app));
  return apps;
}

bool isInstalled(device::Device& device, std::string_view identifier) {
  const auto record = device.platform().defaultRegistry().recordForIdentifier(identifier, PlaceholderLookup::on);
  return record && record->isInstalled();
}

bool isAwaited(device::Device& device, std::string_view identifier) {
  const auto record = device.platform().defaultRegistry().recordForIdentifier(identifier, PlaceholderLookup::on);
  return !record || record->isPlaceholder();
}

bool isForbidden(device::Device& device, RestrictionSetting setting) {
  return device.platform().sharedConnection().effectiveBoolValueForSetting(setting) == RestrictionValue::no;
}

host::IdentifierSet deletedIn(const plist::Dictionary& report) {
  host::IdentifierSet identifiers;
  const plist::Value* deleted = report.find(kDeletedKey);
  if (deleted == nullptr || deleted->array() == nullptr) return identifiers;
  for (const plist::Value& app : *deleted->array()) {
    if (const auto identifier = stringIn(app.find(platform::BundleIdentifierKey))) identifiers.emplace(*identifier);
  }
  return identifiers;
}

Error interrupted() {
  return {std::string(platform::kZTErrorDomain), static_cast<long>(device::TransferFailure::interrupted),
          "the sync was interrupted; the app is offered again at the next sync", nullptr};
}

Error cancelled() {
  return {std::string(platform::kZTErrorDomain), static_cast<long>(device::TransferFailure::cancelled),
          std::string(host::kCancelledOnDevice), nullptr};
}

Error packageMissingError() {
  return {std::string(platform::kZTErrorDomain), static_cast<long>(device::TransferFailure::hostLost),
          "the library has no package of this app", nullptr};
}

std::unique_ptr<InstallWatcher> makeWatcher(device::Device& device, host::SyncProgress& progress,
                                            const host::InterruptSignals& interruption) {
  const bool isCoordinated = device.platform().installCoordination().coordinationIsEnabled();
  return (isCoordinated ? makeCoordinatedInstallWatcher : makeDirectInstallWatcher)(device, progress, interruption);
}

/// Connects the device's services to the daemon for the object's lifetime.
class ServiceConnection {
 public:
  ServiceConnection(device::Device& device, platform::ZTDeviceService& daemon)
      : service_(device.services().sharedInstance()) {
    service_.connect(&daemon);
  }
  ~ServiceConnection() { service_.connect(nullptr); }
  ServiceConnection(const ServiceConnection&) = delete;
  ServiceConnection& operator=(const ServiceConnection&) = delete;

 private:
  device::DeviceService& service_;
};

}  // namespace

Daemon::Daemon(device::Device& device, platform::ZTClient& client, host::SyncProgress& progress,
               const host::InterruptSignals& interruption)
    : device_(device),
      client_(client),
      progress_(progress),
      interruption_(interruption),
      sender_(device.services().fileSystem()) {}

Status Daemon::sync(const SyncRequest& request) {
  Result<host::HostState> state = host::loadHostState(device_.path());
  if (!state) return state.error();
  state_ = std::move(state).value();
  const ServiceConnection connection(device_, queue_);
  const auto control = openSyncControl(device_);
  if (!control) {
    progress_.warn("`appsync tap` and `appsync cancel` cannot reach this sync: " + control.error().text);
  }
  auto watcher = makeWatcher(device_, progress_, interruption_);
  watcher->waitForOthers();
  cancelStaleCoordinators(device_);
  device_.platform().systemNotify().post(platform::kZTStartupCompleteNotification);
  client_.prepareForSyncWithHostAnchor(client_.currentSyncAnchor(), {}, nullptr);
  recordDeletedApps();
  Status started = planSync(request);
  reportDecidedApps();
  if (started) started = handOverInstructions();
  if (!started) {
    failEverything(started.error());
    client_.assetTransferEndedWithSuccess(false);
    client_.syncEndedWithSuccess(false);
    return started;
  }
  reportRemovals(*watcher);
  transferPackages(*watcher);
  watcher.reset();
  cancelStaleCoordinators(device_);
  reportUnfinishedApps();
  Status saved = saveState();
  client_.syncEndedWithSuccess(saved.ok() && !interruption_.requested());
  host::clearStaging(device_);
  return saved;
}

void Daemon::recordDeletedApps() {
  state_.addDeleted(deletedIn(client_.installedAssets()));
}

Status Daemon::planSync(const SyncRequest& request) {
  const Result<AppsByIdentifier> apps = appsByIdentifier(device_);
  if (!apps) return apps.error();
  const host::IdentifierSet fromStore = awaitedFromStore(device_);
  plan_ = host::makePlan({request.library, *apps, state_.declined, request.only, request.remove, fromStore});
  for (const std::string& identifier : request.only)
    state_.declined.erase(identifier);
  state_.declined.insert(request.remove.begin(), request.remove.end());
  for (const host::PlannedApp& app : plan_) {
    if (app.package == nullptr) continue;
    state_.offered.insert(app.name.identifier);
    transfers_.emplace(app.name.identifier, &app);
  }
  markDemotedAppsAsRestored(*apps);
  return {};
}

/// In direct mode the plug-in requests no package for an app with a placeholder unless its install type is Restore, so
/// this sets that type on demoted apps that are to be reinstalled.
void Daemon::markDemotedAppsAsRestored(const std::map<std::string, host::DeviceApp, std::less<>>& apps) {
  if (device_.platform().installCoordination().coordinationIsEnabled()) return;
  for (const auto& [identifier, app] : transfers_) {
    const auto present = apps.find(identifier);
    const bool isDemoted =
        present != apps.end() && !present->second.isInstalled && device::isDemotion(present->second.installType);
    if (!isDemoted) continue;
    // If it fails, the plug-in does not request the package, and the app is reported as failed.
    device_.services().defaultRegistry().setPlaceholderType(identifier, platform::TSInstallType::Restore).ignore();
  }
}

/// Saves the host's state before the device acts on it, so that a crash at any moment is safe.
Status Daemon::handOverInstructions() {
  if (Status staged = host::stage(device_, plan_); !staged) return staged.error().in("the device cannot be synced");
  RETURN_IF_ERROR(host::saveHostState(device_.path(), state_));
  std::optional<Error> error;
  if (client_.reconcileSync({}, client_.currentSyncAnchor(), {}, &error)) return {};
  return error.value_or(Error{}).in("the device cannot be synced");
}

void Daemon::transferPackages(InstallWatcher& watcher) {
  const platform::Assets assets = client_.outstandingAssetTransfers();
  for (const auto& asset : assets) {
    const host::PlannedApp* app = planned(asset->identifier());
    if (app != nullptr) progress_.expect(app->name, app->package->bytes);
  }
  queue_.fill(assets);
  StoreRun store(device_, plan_, progress_, watcher, interruption_);
  while (const auto next = queue_.front()) {
    const host::PlannedApp* app = planned(next->identifier());
    watcher.waitForSpace(app == nullptr ? 0 : app->package->bytes);
    // The first package may have changed during the wait.
    if (const auto asset = queue_.take()) transfer(asset, watcher);
  }
  client_.assetTransferEndedWithSuccess(!interruption_.requested());
  store.wait();
  watcher.waitForInstalls();
}

void Daemon::transfer(const std::shared_ptr<ZTAsset>& asset, InstallWatcher& watcher) {
  const host::PlannedApp* app = planned(asset->identifier());
  if (app == nullptr) return client_.assetTransferSucceeded(asset, false, packageMissingError());
  const auto mayContinue = [&] { return !interruption_.requested() && !queue_.wasCancelled(asset->identifier()); };
  std::chrono::steady_clock::time_point reportedAt;
  const auto goOn = [&](double fraction) {
    const auto now = std::chrono::steady_clock::now();
    if (fraction >= 1 || now - reportedAt >= kShortestTimeBetweenUpdates) {
      reportedAt = now;
      asset->setDownloadProgress(fraction);
      client_.assetTransferUpdatedProgress(asset, fraction);
      progress_.sending(asset->identifier(), fraction);
    }
    return mayContinue();
  };
  const Result<std::string> path = mayContinue() ? sender_.send(*app->package, goOn) : interrupted();
  if (!path) {
    const TransferFailure failure = transferFailureOf(*app, path.error());
    client_.assetTransferSucceeded(asset, false, failure.error);
    progress_.finish({failure.event, app->name, failure.error.text});
    return;
  }
  asset->setPath(*path);
  asset->setCompletedAssetParts(platform::kZTAssetPartApplication);
  const host::AppEvent success =
      app->work == host::PlannedWork::update ? host::AppEvent::updated : host::AppEvent::installed;
  watcher.watch({app->name, success, std::string(kPublicStaging) + "/" + *path, app->package->bytes,
                 std::chrono::steady_clock::now()});
  progress_.installing(asset->identifier(), 0);
  client_.assetTransferSucceeded(asset, true, std::nullopt);
  handOverData(asset);
}

void Daemon::handOverData(const std::shared_ptr<ZTAsset>& asset) {
  if (!asset->isRestore()) return;
  if (!device_.platform().makeBackupManager()->restoreDataExists(asset->identifier(), nullptr)) return;
  // The client has stored the package's path itself.
  asset->setPath(std::nullopt);
  asset->setCompletedAssetParts(platform::kZTAssetPartApplicationData);
  client_.assetTransferSucceeded(asset, true, std::nullopt);
}

Daemon::TransferFailure Daemon::transferFailureOf(const host::PlannedApp& app, const Error& error) const {
  if (queue_.wasCancelled(app.name.identifier)) return {host::AppEvent::skipped, cancelled()};
  if (interruption_.requested()) return {host::AppEvent::cutOff, interrupted()};
  return {host::AppEvent::failed, error};
}

void Daemon::reportDecidedApps() {
  for (const host::PlannedApp& app : plan_) {
    if (app.work == host::PlannedWork::none) progress_.finish({host::AppEvent::unchanged, app.name, app.reason});
    if (app.work == host::PlannedWork::skip) progress_.finish({host::AppEvent::skipped, app.name, app.reason});
    if (app.work == host::PlannedWork::refuse) progress_.finish({host::AppEvent::failed, app.name, app.reason});
  }
}

void Daemon::reportRemovals(InstallWatcher& watcher) {
  watcher.waitForOthers();
  const bool forbidden = isForbidden(device_, RestrictionSetting::appRemovalAllowed);
  for (const host::PlannedApp& app : plan_) {
    if (app.work != host::PlannedWork::remove) continue;
    if (!isInstalled(device_, app.name.identifier)) {
      progress_.finish({host::AppEvent::removed, app.name, {}});
    } else if (forbidden) {
      progress_.finish(
          {host::AppEvent::skipped, app.name, "removing apps is not allowed on this device (app-removal=no)"});
    } else {
      progress_.finish({host::AppEvent::failed, app.name, app.reason});
    }
  }
}

void Daemon::reportUnfinishedApps() {
  const bool forbidden = isForbidden(device_, RestrictionSetting::appInstallationAllowed);
  for (const host::PlannedApp& app : plan_) {
    if (app.work == host::PlannedWork::restore) {
      progress_.finish(
          {host::AppEvent::failed, app.name, "the store did not deliver its package; the next sync tries again"});
    }
    if (app.package == nullptr) continue;
    if (queue_.wasCancelled(app.name.identifier)) {
      progress_.finish({host::AppEvent::skipped, app.name, std::string(host::kCancelledOnDevice)});
    } else if (forbidden) {
      progress_.finish(
          {host::AppEvent::skipped, app.name, "installing apps is not allowed on this device (app-installation=no)"});
    } else if (interruption_.requested()) {
      progress_.finish({host::AppEvent::cutOff, app.name, interrupted().text});
    } else {
      progress_.finish({host::AppEvent::failed, app.name, "the device did not ask for its package"});
    }
  }
}

void Daemon::failEverything(const Error& error) {
  for (const host::PlannedApp& app : plan_)
    progress_.finish({host::AppEvent::failed, app.name, error.text});
}

const host::PlannedApp* Daemon::planned(std::string_view identifier) const {
  const auto found = transfers_.find(identifier);
  return found == transfers_.end() ? nullptr : found->second;
}

Status Daemon::saveState() {
  std::erase_if(state_.offered, [&](const std::string& identifier) { return !isAwaited(device_, identifier); });
  std::erase_if(state_.declined, [&](const std::string& identifier) { return isInstalled(device_, identifier); });
  return host::saveHostState(device_.path(), state_);
}

}  // namespace appsync::daemon
