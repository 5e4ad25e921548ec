// The callbacks of the install-coordination service and of the registry.
#include "common/SyncError.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"

namespace appsync {

namespace {

using platform::ClientIdentity;
using platform::InstallCoordinator;
using platform::ZTAsset;
using platform::ZTDeviceService;

/// An asset that names the app to the daemon's services, no more.
std::shared_ptr<ZTAsset> assetNamed(platform::Platform& platform, std::string_view identifier) {
  return platform.syncFramework().downloadAssetWithIdentifier(identifier, kApplicationDataclass, std::nullopt);
}

}  // namespace

void AppsClient::setupInstallCoordinatorObserver() {
  if (_appInstallObserver) return;
  _appInstallObserver = _platform.installCoordination().initWithMachServiceName(
      "com.corvel.zeph.xpc.cnappobserverdelegate", {ClientIdentity::CXClientSync}, *this);
}

void AppsClient::promiseDidBeginFulfillmentWithIdentifier(std::uint64_t identifier) {
  _log.message("%s|promiseDidBeginFulfillmentWithIdentifier %lu", identifier);
}

void AppsClient::coordinatorDidInstallPlaceholder(InstallCoordinator& coordinator) {
  const auto identifier = coordinator.bundleID();
  _log.message("%s|coordinatorDidInstallPlaceholder for %{public}@ with error %{public}@", identifier,
               coordinator.coordinatorError());
  cnDidInstallPlaceHolderForAppBundle(identifier);
}

void AppsClient::coordinatorDidCompleteSuccessfully(InstallCoordinator& coordinator) {
  const auto identifier = coordinator.bundleID();
  const auto error = coordinator.coordinatorError();
  _log.message("%s|coordinatorDidCompleteSuccessfully for %{public}@ with error %{public}@", identifier, error);
  if (!identifier) return;
  _accessQueue.sync([&] {
    changeAssetID(*identifier, error ? todo::kFailed : todo::kInstalled);
    cleanRestoreStateForIdentifier(*identifier);
  });
}

void AppsClient::coordinatorShouldPrioritize(InstallCoordinator& coordinator) {
  const auto identifier = coordinator.bundleID();
  if (!identifier) return;
  _log.message("%s|Prioritize %{public}@", *identifier);
  ZTDeviceService& service = _platform.sharedInstance();
  if (!service.supports(ZTDeviceService::Operation::prioritizeAsset)) {
    _log.error("%s|Cannot prioritize %{public}@ as it's not supported", *identifier);
    return;
  }
  // The completion may outlive the object: it owns what it needs.
  service.prioritizeAsset(assetNamed(_platform, *identifier),
                          [log = _log, identifier = *identifier](const std::optional<Error>& error) {
                            log.message("%s|Prioritize %{public}@ finished with error %{public}@", identifier, error);
                          });
}

void AppsClient::coordinatorCanceledWithReason(InstallCoordinator& coordinator, const Error&, ClientIdentity) {
  const auto identifier = coordinator.bundleID();
  if (!identifier) return;
  const bool wasCancelled = _accessQueue.sync([&] { return !_userCancelledApps.insert(*identifier).second; });
  ZTDeviceService& service = _platform.sharedInstance();
  if (wasCancelled || !service.supports(ZTDeviceService::Operation::cancelAssetTransferForFailedAsset)) {
    _log.error("%s|Cannot cancel %{public}@ as it's already cancelled %d OR the call is not supported", *identifier,
               wasCancelled);
    return;
  }
  _log.message("%s|Cancelling asset sync for %{public}@", *identifier);
  service.cancelAssetTransferForFailedAsset(assetNamed(_platform, *identifier));
}

void AppsClient::applicationInstallsDidCancel(const platform::AppRecords& records) {
  if (_useInstallCoordinator) {
    _log.message("%s|not handling applicationInstallsDidCancel because install coordination is enabled.");
    return;
  }
  for (const auto& record : records) {
    if (record->installType() != platform::TSInstallType::Restore) continue;
    assetTransferSucceeded(assetNamed(_platform, record->applicationIdentifier()), false,
                           syncError(SyncFailure::restoreCancelled));
  }
}

}  // namespace appsync
