#include "daemon/Daemon.h"

#include <algorithm>
#include <chrono>
#include <utility>

#include "base/ReturnIfError.h"
#include "daemon/CoordinatorCleanup.h"
#include "daemon/SyncControl.h"
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
    apps.emplace(app.app.identifier, std::move(app));
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
  const plist::Value* deleted = report.find("_Deleted");
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

Error hostHasNone() {
  return {std::string(platform::kZTErrorDomain), static_cast<long>(device::TransferFailure::hostLost),
          "the library has no package of this app", nullptr};
}

std::unique_ptr<InstallWatcher> makeWatcher(device::Device& device, host::SyncProgress& progress,
                                            const host::Interruption& interruption) {
  const bool isCoordinated = device.platform().installCoordination().coordinationIsEnabled();
  return (isCoordinated ? makeCoordinatedInstallWatcher : makeDirectInstallWatcher)(device, progress, interruption);
}

/// While it lives the device's services reach the daemon.
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
               const host::Interruption& interruption)
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
    progress_.warn("this sync cannot be reached by `appsync tap` and `appsync cancel`: " + control.error().text);
  }
  auto watcher = makeWatcher(device_, progress_, interruption_);
  watcher->waitForOthers();
  giveUpLeftovers(device_);
  device_.platform().systemNotify().post(platform::kZTStartupCompleteNotification);
  client_.prepareForSyncWithHostAnchor(client_.currentSyncAnchor(), {}, nullptr);
  learnDeletedApps();
  Status begun = planSync(request);
  tellWhatIsKnown();
  if (begun) begun = handOverInstructions();
  if (!begun) {
    failEverything(begun.error());
    client_.assetTransferEndedWithSuccess(false);
    client_.syncEndedWithSuccess(false);
    return begun;
  }
  tellRemovals(*watcher);
  transferPackages(*watcher);
  watcher.reset();
  giveUpLeftovers(device_);
  tellUnfinished();
  Status remembered = remember();
  client_.syncEndedWithSuccess(remembered.ok() && !interruption_.requested());
  host::clearStaging(device_);
  return remembered;
}

void Daemon::learnDeletedApps() {
  state_.learnDeleted(deletedIn(client_.installedAssets()));
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
    state_.offered.insert(app.app.identifier);
    transfers_.emplace(app.app.identifier, &app);
  }
  wakeDemotedApps(*apps);
  return {};
}

/// Who installs directly asks for no package of an app that has a placeholder, unless it was restored: a demoted app
/// that is wanted again counts as that.
void Daemon::wakeDemotedApps(const std::map<std::string, host::DeviceApp, std::less<>>& apps) {
  if (device_.platform().installCoordination().coordinationIsEnabled()) return;
  for (const auto& [identifier, app] : transfers_) {
    const auto present = apps.find(identifier);
    const bool isDemoted =
        present != apps.end() && !present->second.isInstalled && device::isDemotion(present->second.installType);
    if (!isDemoted) continue;
    // One that cannot be changed is not asked for, and told so.
    device_.services().defaultRegistry().setPlaceholderType(identifier, platform::TSInstallType::Restore).ignore();
  }
}

/// What the host knows must be safe before the device acts on it: a kill may come at any moment.
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
    if (app != nullptr) progress_.expect(app->app, app->package->bytes);
  }
  queue_.fill(assets);
  StoreRun store(device_, plan_, progress_, watcher, interruption_);
  while (const auto next = queue_.front()) {
    const host::PlannedApp* app = planned(next->identifier());
    watcher.waitForRoom(app == nullptr ? 0 : app->package->bytes);
    // Meanwhile another may have become the first.
    if (const auto asset = queue_.take()) transfer(asset, watcher);
  }
  client_.assetTransferEndedWithSuccess(!interruption_.requested());
  store.wait();
  watcher.waitForInstalls();
}

void Daemon::transfer(const std::shared_ptr<ZTAsset>& asset, InstallWatcher& watcher) {
  const host::PlannedApp* app = planned(asset->identifier());
  if (app == nullptr) return client_.assetTransferSucceeded(asset, false, hostHasNone());
  const auto mayGoOn = [&] { return !interruption_.requested() && !queue_.wasCancelled(asset->identifier()); };
  std::chrono::steady_clock::time_point told;
  const auto goOn = [&](double fraction) {
    const auto now = std::chrono::steady_clock::now();
    if (fraction >= 1 || now - told >= kShortestTimeBetweenUpdates) {
      told = now;
      asset->setDownloadProgress(fraction);
      client_.assetTransferUpdatedProgress(asset, fraction);
      progress_.sending(asset->identifier(), fraction);
    }
    return mayGoOn();
  };
  const Result<std::string> path = mayGoOn() ? sender_.send(*app->package, goOn) : interrupted();
  if (!path) {
    const NotSent end = endOf(*app, path.error());
    client_.assetTransferSucceeded(asset, false, end.error);
    progress_.finish({end.event, app->app, end.error.text});
    return;
  }
  asset->setPath(*path);
  asset->setCompletedAssetParts(platform::kZTAssetPartApplication);
  const host::AppEvent success =
      app->work == host::PlannedWork::update ? host::AppEvent::updated : host::AppEvent::installed;
  watcher.watch({app->app, success, std::string(kPublicStaging) + "/" + *path, app->package->bytes,
                 std::chrono::steady_clock::now()});
  progress_.installing(asset->identifier(), 0);
  client_.assetTransferSucceeded(asset, true, std::nullopt);
  handOverData(asset);
}

void Daemon::handOverData(const std::shared_ptr<ZTAsset>& asset) {
  if (!asset->isRestore()) return;
  if (!device_.platform().makeBackupManager()->restoreDataExists(asset->identifier(), nullptr)) return;
  // The client has parked the package, and finds it again by itself.
  asset->setPath(std::nullopt);
  asset->setCompletedAssetParts(platform::kZTAssetPartApplicationData);
  client_.assetTransferSucceeded(asset, true, std::nullopt);
}

Daemon::NotSent Daemon::endOf(const host::PlannedApp& app, const Error& error) const {
  if (queue_.wasCancelled(app.app.identifier)) return {host::AppEvent::skipped, cancelled()};
  if (interruption_.requested()) return {host::AppEvent::cutOff, interrupted()};
  return {host::AppEvent::failed, error};
}

void Daemon::tellWhatIsKnown() {
  for (const host::PlannedApp& app : plan_) {
    if (app.work == host::PlannedWork::none) progress_.finish({host::AppEvent::unchanged, app.app, app.reason});
    if (app.work == host::PlannedWork::skip) progress_.finish({host::AppEvent::skipped, app.app, app.reason});
    if (app.work == host::PlannedWork::refuse) progress_.finish({host::AppEvent::failed, app.app, app.reason});
  }
}

void Daemon::tellRemovals(InstallWatcher& watcher) {
  watcher.waitForOthers();
  const bool forbidden = isForbidden(device_, RestrictionSetting::appRemovalAllowed);
  for (const host::PlannedApp& app : plan_) {
    if (app.work != host::PlannedWork::remove) continue;
    if (!isInstalled(device_, app.app.identifier)) {
      progress_.finish({host::AppEvent::removed, app.app, {}});
    } else if (forbidden) {
      progress_.finish(
          {host::AppEvent::skipped, app.app, "removing apps is not allowed on this device (app-removal=no)"});
    } else {
      progress_.finish({host::AppEvent::failed, app.app, app.reason});
    }
  }
}

void Daemon::tellUnfinished() {
  const bool forbidden = isForbidden(device_, RestrictionSetting::appInstallationAllowed);
  for (const host::PlannedApp& app : plan_) {
    if (app.work == host::PlannedWork::restore) {
      progress_.finish(
          {host::AppEvent::failed, app.app, "the store did not bring its package; the next sync tries again"});
    }
    if (app.package == nullptr) continue;
    if (queue_.wasCancelled(app.app.identifier)) {
      progress_.finish({host::AppEvent::skipped, app.app, std::string(host::kCancelledOnDevice)});
    } else if (forbidden) {
      progress_.finish(
          {host::AppEvent::skipped, app.app, "installing apps is not allowed on this device (app-installation=no)"});
    } else if (interruption_.requested()) {
      progress_.finish({host::AppEvent::cutOff, app.app, interrupted().text});
    } else {
      progress_.finish({host::AppEvent::failed, app.app, "the device did not ask for its package"});
    }
  }
}

void Daemon::failEverything(const Error& error) {
  for (const host::PlannedApp& app : plan_)
    progress_.finish({host::AppEvent::failed, app.app, error.text});
}

const host::PlannedApp* Daemon::planned(std::string_view identifier) const {
  const auto found = transfers_.find(identifier);
  return found == transfers_.end() ? nullptr : found->second;
}

Status Daemon::remember() {
  std::erase_if(state_.offered, [&](const std::string& identifier) { return !isAwaited(device_, identifier); });
  std::erase_if(state_.declined, [&](const std::string& identifier) { return isInstalled(device_, identifier); });
  return host::saveHostState(device_.path(), state_);
}

}  // namespace appsync::daemon
