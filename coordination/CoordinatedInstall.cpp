// Making everything ready for a package that the host is about to send.
#include "common/PropertyListFile.h"
#include "common/SyncError.h"
#include "common/TransactionSteps.h"
#include "coordination/InstallPreparation.h"
#include "core/AppsClient.h"

namespace appsync {

namespace {

using platform::StoreMetadata;
using platform::TransactionStep;
using platform::TSInstallType;
using platform::ZTAsset;

bool canBeNamed(const ZTAsset& asset) {
  return !asset.prettyName().value_or("").empty() || !asset.identifier().empty();
}

bool takeCoordinator(InstallPreparation& preparation, bool existingApp) {
  preparation.coordinator = preparation.client._initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier(
      preparation.identifier, existingApp, true, &preparation.error);
  if (!preparation.coordinator) return false;
  preparation.coordinator->setObserver(preparation.client.weak_from_this());
  return true;
}

bool provideInstallOptions(InstallPreparation& preparation) {
  if (preparation.coordinator->hasInstallOptions()) {
    preparation.log.message("%s|coordinator for %{public}@ has install options", preparation.identifier);
    return true;
  }
  constexpr std::uint64_t kInstallTargetType = 1;
  if (const plist::Dictionary* store = preparation.store.dictionary()) {
    preparation.storeMetadata = StoreMetadata::initWithDictionary(*store);
  }
  platform::InstallOptions options;
  options.setStoreMetadata(preparation.storeMetadata);
  options.setInstallType(TSInstallType::Sync);
  options.setInstallTargetType(kInstallTargetType);
  return preparation.report(preparation.coordinator->setInstallOptions(options),
                            "%s|set install options on coordinator for %{public}@",
                            "%s|Error %{public}@ setting install options on coordinator for '%{public}@'");
}

/// There are none: everything that the app needs comes in its package.
bool provideOnDemandResources(InstallPreparation& preparation) {
  if (preparation.coordinator->hasInitialODRAssetPromises()) {
    preparation.log.message("%s|coordinator for %{public}@ has an ODR app asset promise", preparation.identifier);
    return true;
  }
  return preparation.report(preparation.coordinator->setInitialODRAssetPromises({}),
                            "%s|set ODR asset promise to install coordinator for %{public}@",
                            "%s|Error %{public}@ setting ODR asset promise for '%{public}@'");
}

/// The promise has no path yet: the package is still to come.
bool provideAppAssetPromise(InstallPreparation& preparation) {
  if (preparation.coordinator->hasAppAssetPromise()) {
    preparation.log.message("%s|coordinator for %{public}@ has an app asset promise", preparation.identifier);
    return true;
  }
  return preparation.client._createAppAssetPromiseForBundleIdentifier(preparation.identifier, std::nullopt,
                                                                      preparation.coordinator) != nullptr;
}

/// What the preparation holds must not stay behind.
void giveUp(const InstallPreparation& preparation) {
  const Error reason = syncError(SyncFailure::preparationFailed);
  preparation.cancelPlaceholder(reason);
  preparation.cancelCoordinator(reason);
}

}  // namespace

bool AppsClient::prepareAppForInstallUsingCoordination(const ZTAsset& asset, bool existingApp) {
  platform::FileSystem& files = _platform.fileSystem();
  InstallPreparation preparation{{*this, _platform, _log, asset.identifier()},
                                 asset,
                                 readDictionary(files, asset.infoPlist()),
                                 readDictionary(files, asset.storePlist())};
  const std::string& identifier = asset.identifier();
  _log.summary(
      "%s|processing app install for bundle '%{public}@', title %{public}@ assetplist %{public}@, version %{public}@ with install coordination",
      identifier, asset.prettyName(), preparation.info, asset.version());
  beginStep(_platform.transactionLog(), TransactionStep::installApp, identifier,
            existingApp ? "Update app" : "Install App");

  const bool isReady = canBeNamed(asset) && takeCoordinator(preparation, existingApp) &&
                       provideInstallOptions(preparation) && provideOnDemandResources(preparation) &&
                       provideAppAssetPromise(preparation) && providePlaceholder(preparation);

  _log.message("%s|processing app install for bundle %{public}@ finished with status %d error %{public}@", identifier,
               isReady, preparation.error);
  endStep(_platform.transactionLog(), TransactionStep::installApp, isReady, identifier, "Install app");
  if (!isReady) giveUp(preparation);
  return isReady;
}

}  // namespace appsync
