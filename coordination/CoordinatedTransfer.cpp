// Reports to a coordinator on the transfer of its app's package.
#include "common/SyncError.h"
#include "core/AppsClient.h"
#include "platform/InstallPromise.h"

namespace appsync {

namespace {

using platform::ClientIdentity;
using platform::FileLocation;
using platform::InstallCoordinator;
using platform::ZTAsset;

bool isComplete(const std::shared_ptr<platform::PromisedTransferToPath>& promise) {
  return promise && promise->isComplete();
}

/// Returns the coordinator of a package that is being transferred, or null if none can still receive it.
std::shared_ptr<InstallCoordinator> usableCoordinator(AppsClient& client, std::string_view identifier,
                                                      bool existingApp) {
  auto coordinator =
      client._initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier(identifier, existingApp, false, nullptr);
  return coordinator && !coordinator->coordinatorError() ? coordinator : nullptr;
}

void satisfyAppAssetPromise(AppsClient& client, const ZTAsset& asset,
                            const std::shared_ptr<InstallCoordinator>& coordinator, const PlugInLog& log) {
  const std::string& identifier = asset.identifier();
  auto promise = coordinator->appAssetPromise();
  if (isComplete(promise)) {
    log.message("%s|Asset promise is already satisfied for %{public}@", identifier);
    return;
  }
  if (!promise) {
    promise = client._createAppAssetPromiseForBundleIdentifier(identifier, asset.path(), coordinator);
  } else if (const auto location = FileLocation::file(asset.path().value_or(""))) {
    promise->setTransferPath(*location);
  }
  log.message("%s|Satisfying asset promise for %{public}@", identifier);
  if (promise) fulfil(*promise);
}

}  // namespace

bool AppsClient::updateTransferProgressForApp(const ZTAsset& asset, bool existingApp) {
  const std::string& identifier = asset.identifier();
  const auto coordinator = usableCoordinator(*this, identifier, existingApp);
  if (!coordinator) return false;
  auto promise = coordinator->appAssetPromise();
  if (isComplete(promise)) {
    _log.message("%s|Asset promise is already satisfied for %{public}@", identifier);
    return false;
  }
  if (!promise) promise = _createAppAssetPromiseForBundleIdentifier(identifier, asset.path(), coordinator);
  _log.message("%s|Updating download progress: %f install progress:%f for %{public}@", asset.downloadProgress(),
               asset.installProgress(), identifier);
  if (promise) promise->setPercentComplete(asset.downloadProgress());
  return true;
}

void AppsClient::transferCompleteForApp(const ZTAsset& asset, const std::optional<Error>& error, bool isExistingApp) {
  const auto coordinator = usableCoordinator(*this, asset.identifier(), isExistingApp);
  if (!coordinator) return;
  if (error) {
    constexpr long kTransferFailed = 1;
    const Error reason = _platform.installCoordination().createUserPresentableError(kTransferFailed, {}, *error);
    coordinator->cancelForReason(reason, ClientIdentity::CXClientSync).ignore();
  } else {
    satisfyAppAssetPromise(*this, asset, coordinator, _log);
  }
}

void AppsClient::assetSyncFinishedWithStatus(bool success, const IdentifierSet& outstandingItems) {
  for (const std::string& identifier : outstandingItems) {
    const auto coordinator = _platform.installCoordination().coordinatorForApp(
        platform::CoordinatorKind::any, identifier, ClientIdentity::CXClientSync, platform::IfMissing::findNothing,
        nullptr, nullptr);
    if (!coordinator || success) continue;
    const Error error = syncError(SyncFailure::installGivenUp);
    _log.message("%s|Cancelling coordinator with error %{public}@ for %{public}@", error, identifier);
    coordinator->cancelForReason(error, ClientIdentity::CXClientSync).ignore();
  }
}

}  // namespace appsync
