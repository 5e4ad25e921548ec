// What coordinated installs and restores are put together from: coordinators, placeholders and promises.
#include "common/SyncError.h"
#include "common/TransactionSteps.h"
#include "core/AppsClient.h"
#include "platform/InstallPromise.h"

namespace appsync {

namespace {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using platform::FileLocation;
using platform::IfMissing;
using platform::InstallCoordinator;
using platform::Placeholder;
using platform::PromisedOutOfBandTransfer;
using platform::PromisedTransferToPath;
using platform::TransactionStep;

std::string promiseName(std::string_view bundleIdentifier, std::string_view suffix) {
  return std::string(bundleIdentifier).append(suffix);
}

}  // namespace

std::shared_ptr<InstallCoordinator> AppsClient::_initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier(
    std::string_view bundleIdentifier, bool existingApp, bool createIfNotExisting, ErrorSlot error) {
  beginStep(_platform.transactionLog(), TransactionStep::createCoordinator, bundleIdentifier, "Create coordinator");
  std::optional<Error> serviceError;
  auto coordinator = _platform.installCoordination().coordinatorForApp(
      existingApp ? CoordinatorKind::updating : CoordinatorKind::initiating, bundleIdentifier,
      ClientIdentity::CXClientSync, createIfNotExisting ? IfMissing::create : IfMissing::findNothing, nullptr,
      &serviceError);

  const char* const kind = existingApp ? "updating" : "initiating";
  const auto creator = coordinator ? std::optional(coordinator->creatorIdentifier()) : std::nullopt;
  if (creator == ClientIdentity::CXClientSync) {
    _log.message(
        "%s|Created %s coordinator %{public}@ (createIfNotExisting:%d, existingApp:%d) for %{public}@ with error %{public}@",
        kind, coordinator, createIfNotExisting, existingApp, bundleIdentifier, serviceError);
  } else if (creator) {
    _log.message(
        "%s|CN returned %s coordinator %{public}@ (createIfNotExisting:%d, existingApp:%d, creatorIdentifier=%lu) for %{public}@ with error %{public}@ - Will not perform install/update for this bundle",
        kind, coordinator, createIfNotExisting, existingApp, static_cast<std::uint64_t>(*creator), bundleIdentifier,
        serviceError);
    coordinator.reset();
  }
  if (error != nullptr) *error = serviceError;
  endStep(_platform.transactionLog(), TransactionStep::createCoordinator, coordinator != nullptr, bundleIdentifier,
          "Finished creating coordinator");
  return coordinator;
}

std::shared_ptr<Placeholder> AppsClient::_placeHolderForBundleIdentifier(std::string_view bundleIdentifier,
                                                                         std::string_view name,
                                                                         platform::TSInstallType installType) {
  beginStep(_platform.transactionLog(), TransactionStep::createPlaceholder, bundleIdentifier, "Create placeholder");
  auto placeholder = _platform.installCoordination().initAppPlaceholder(name, bundleIdentifier, installType,
                                                                        ClientIdentity::CXClientSync);
  endStep(_platform.transactionLog(), TransactionStep::createPlaceholder, placeholder != nullptr, bundleIdentifier,
          "Finished creating placeholder");
  _log.message("%s|Created placeholder %{public}@ for '%{public}@' of type %lu", placeholder, bundleIdentifier,
               static_cast<std::uint64_t>(installType));
  return placeholder;
}

std::shared_ptr<PromisedTransferToPath> AppsClient::_createAppAssetPromiseForBundleIdentifier(
    std::string_view bundleIdentifier, const std::optional<std::string>& path,
    const std::shared_ptr<InstallCoordinator>& coordinator) {
  if (!coordinator) return nullptr;
  auto promise = _platform.installCoordination().makePromisedTransferToPath(
      promiseName(bundleIdentifier, "-Asset"), ClientIdentity::CXClientSync,
      path ? FileLocation::file(*path) : std::nullopt, 0);
  if (!promise) {
    _log.error("%s|Error creating asset promise for '%{public}@'", bundleIdentifier);
    return nullptr;
  }
  if (const Status added = coordinator->setAppAssetPromise(promise); !added) {
    _log.error("%s|Error %{public}@ adding app asset promise at %{public}@ to '%{public}@'", added.error(), path,
               bundleIdentifier);
    _log.error("%s|Cancelling asset promise for '%{public}@'", bundleIdentifier);
    promise->cancelForReason(syncError(SyncFailure::installGivenUp), ClientIdentity::CXClientSync).ignore();
    return nullptr;
  }
  _log.message("%s|Added app asset promise to coordinator for '%{public}@'", bundleIdentifier);
  return promise;
}

std::shared_ptr<PromisedTransferToPath> AppsClient::_createIconPromiseForBundleIdentifier(
    std::string_view bundleIdentifier, std::string_view transferPath, std::uint64_t diskSpaceNeeded,
    const std::shared_ptr<Placeholder>& placeHolder, bool forAppInstall) {
  if (!placeHolder) {
    _log.error("%s|Placeholder to add icon promise is nil for '%{public}@'", bundleIdentifier);
    return nullptr;
  }
  auto promise = _platform.installCoordination().makePromisedTransferToPath(
      promiseName(bundleIdentifier, "-Icon"), ClientIdentity::CXClientSync, FileLocation::file(transferPath),
      diskSpaceNeeded);
  if (!promise) return nullptr;
  fulfil(*promise);  // The icon file is there before its promise is.
  if (const Status added = placeHolder->setIconPromise(promise); !added) {
    _log.error("%s|Error %{public}@ adding icon promise to placeholder for '%{public}@'", added.error(),
               bundleIdentifier);
    const auto failure = forAppInstall ? SyncFailure::installGivenUp : SyncFailure::restoreGivenUp;
    promise->cancelForReason(syncError(failure), ClientIdentity::CXClientSync).ignore();
    return nullptr;
  }
  _log.message("%s|Added icon promise to placeholder for '%{public}@'", bundleIdentifier);
  return promise;
}

std::shared_ptr<PromisedOutOfBandTransfer> AppsClient::_userDataPromiseForBundleIdentifier(
    std::string_view bundleIdentifier) {
  auto promise = _platform.installCoordination().makePromisedOutOfBandTransfer(
      promiseName(bundleIdentifier, "-UserData"), ClientIdentity::CXClientSync, 0);
  if (promise) fulfil(*promise);
  return promise;
}

}  // namespace appsync
