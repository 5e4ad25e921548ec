// Passing on to a coordinator how its app's package comes, or that it does not.
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

}  // namespace

bool AppsClient::updateTransferProgressForApp(const ZTAsset& asset, bool existingApp) {
  const std::string& identifier = asset.identifier();
  const auto coordinator = _usableCoordinator(identifier, existingApp);
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
  const auto coordinator = _usableCoordinator(asset.identifier(), isExistingApp);
  if (!coordinator) return;
  if (error) {
    constexpr long kTransferFailed = 1;
    const Error reason = _platform.installCoordination().createUserPresentableError(kTransferFailed, {}, *error);
    coordinator->cancelForReason(reason, ClientIdentity::CXClientSync).ignore();
  } else {
    _satisfyAppAssetPromise(asset, coordinator);
  }
}

void AppsClient::_satisfyAppAssetPromise(const ZTAsset& asset, const std::shared_ptr<InstallCoordinator>& coordinator) {
  const std::string& identifier = asset.identifier();
  auto promise = coordinator->appAssetPromise();
  if (isComplete(promise)) {
    _log.message("%s|Asset promise is already satisfied for %{public}@", identifier);
    return;
  }
  if (!promise) {
    promise = _createAppAssetPromiseForBundleIdentifier(identifier, asset.path(), coordinator);
  } else if (const auto location = FileLocation::file(asset.path().value_or(""))) {
    promise->setTransferPath(*location);
  }
  _log.message("%s|Satisfying asset promise for %{public}@", identifier);
  if (promise) fulfil(*promise);
}

void AppsClient::assetSyncFinishedWithStatus(bool success, const Identifiers& outstandingItems) {
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

/// The coordinator of a package that is on its way; null when there is none that could still take it.
std::shared_ptr<InstallCoordinator> AppsClient::_usableCoordinator(std::string_view identifier, bool existingApp) {
  auto coordinator =
      _initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier(identifier, existingApp, false, nullptr);
  return coordinator && !coordinator->coordinatorError() ? coordinator : nullptr;
}

}  // namespace appsync
