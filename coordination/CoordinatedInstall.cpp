// Prepares the coordinator, the promises and the placeholder of an app whose package the host is about to send.
#include "common/PlaceholderBundle.h"
#include "common/PropertyListFile.h"
#include "common/SyncError.h"
#include "common/TransactionSteps.h"
#include "coordination/Preparation.h"
#include "core/AppsClient.h"
#include "plist/Access.h"

namespace appsync {

namespace {

using platform::Placeholder;
using platform::StoreMetadata;
using platform::TransactionStep;
using platform::TSInstallType;
using platform::ZTAsset;

/// One app's preparation, with the host's property lists, each null if the host sent none.
struct InstallPreparation : CoordinatedPreparation {
  const ZTAsset& asset;
  plist::Value info;
  plist::Value store;

  std::optional<StoreMetadata> storeMetadata = {};  ///< nullopt if the coordinator had its options before
};

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

/// None: the package contains everything that the app needs.
bool provideOnDemandResources(InstallPreparation& preparation) {
  if (preparation.coordinator->hasInitialODRAssetPromises()) {
    preparation.log.message("%s|coordinator for %{public}@ has an ODR app asset promise", preparation.identifier);
    return true;
  }
  return preparation.report(preparation.coordinator->setInitialODRAssetPromises({}),
                            "%s|set ODR asset promise to install coordinator for %{public}@",
                            "%s|Error %{public}@ setting ODR asset promise for '%{public}@'");
}

/// The promise has no path yet: the package has not been transferred.
bool provideAppAssetPromise(InstallPreparation& preparation) {
  if (preparation.coordinator->hasAppAssetPromise()) {
    preparation.log.message("%s|coordinator for %{public}@ has an app asset promise", preparation.identifier);
    return true;
  }
  return preparation.client._createAppAssetPromiseForBundleIdentifier(preparation.identifier, std::nullopt,
                                                                      preparation.coordinator) != nullptr;
}

/// The copy of the asset's icon in the placeholder bundle; `size` is 0 if there is none.
struct CopiedIcon {
  std::string path;
  std::uint64_t size = 0;
};

/// Returns 0 if the size is not known.
std::uint64_t sizeOnDisk(InstallPreparation& preparation, const std::string& icon) {
  const auto attributes = preparation.platform.fileSystem().attributesOfItem(icon);
  if (!attributes) preparation.error = attributes.error();
  const std::uint64_t size = attributes ? attributes->size : 0;
  preparation.log.message("%s|icon for %{public}@ at %{public}@ has a size of %llu", preparation.identifier, icon,
                          size);
  return size;
}

CopiedIcon provideIcon(InstallPreparation& preparation) {
  const std::string folder = preparation.client.placeholderAppPathForBundleIdentifier(preparation.identifier);
  CopiedIcon icon{placeholderIconPath(folder)};
  const bool hasFolder = preparation.client.createPlaceHolderPath(folder, preparation.identifier, kMobileOwner);
  if (!hasFolder || !preparation.asset.icon()) return icon;

  platform::TransactionLog& transactions = preparation.platform.transactionLog();
  const std::string& source = preparation.asset.icon()->path;
  beginStep(transactions, TransactionStep::copyIcon, preparation.identifier, "Copying icon");
  const Status copied = copyPlaceholderIcon(preparation.platform.fileSystem(), source, icon.path);
  if (copied) {
    icon.size = sizeOnDisk(preparation, icon.path);
  } else {
    preparation.error = copied.error();
  }
  preparation.log.message(
      "%s|Copied icon from %{public}@ to %{public}@ with error %{public}@ for '%{public}@', sizeOnDisk:%llu", source,
      icon.path, copied.failure(), preparation.identifier, icon.size);
  // A success also if the copy failed: the icon is optional.
  endStep(transactions, TransactionStep::copyIcon, true, preparation.identifier, "Copying icon");
  return icon;
}

/// Stops at the first failure, which is not the preparation's: only the home screen lacks what is missing.
void configurePlaceholder(InstallPreparation& preparation) {
  Placeholder& placeholder = *preparation.placeholder;
  const plist::Dictionary* info = preparation.info.dictionary();
  auto attributes = platform::PlaceholderAttributes::initWithInfoPlistDictionary(info ? *info : plist::Dictionary{});
  attributes.setLaunchProhibited(booleanIn(preparation.info.find(kLaunchProhibitedKey)));
  attributes.setBundleVersion(ownedStringIn(preparation.asset.version()));
  if (const Status set = placeholder.setPlaceholderAttributes(attributes); !set) {
    preparation.error = set.error();
    preparation.log.error("%s|Error %{public}@ setting attributes on placeholder for '%{public}@'", set.error(),
                          preparation.identifier);
    return;
  }
  preparation.log.message("%s|set %{public}@ attributes on placeholder for %{public}@", attributes,
                          preparation.identifier);
  if (!preparation.report(placeholder.setMetadata(preparation.storeMetadata),
                          "%s|set store metadata on placeholder for %{public}@",
                          "%s|Error %{public}@ setting store metadata on placeholder for '%{public}@'")) {
    return;
  }
  preparation.report(placeholder.setConfigurationComplete(),
                     "%s|set placeholder configuration as complete for %{public}@",
                     "%s|Error %{public}@ setting placeholder configuration as complete for '%{public}@'");
}

/// The last step. Returns whether the coordinator has a placeholder.
bool providePlaceholder(InstallPreparation& preparation) {
  if (preparation.coordinator->hasPlaceholderPromise()) {
    preparation.log.message("%s|coordinator for %{public}@ has a placeholder promise", preparation.identifier);
    return true;
  }
  const CopiedIcon icon = provideIcon(preparation);
  preparation.placeholder = preparation.client._placeHolderForBundleIdentifier(
      preparation.identifier, preparation.asset.prettyName().value_or(preparation.identifier), TSInstallType::Sync);
  // Without its icon the placeholder stays unconfigured and is not shown.
  if (preparation.placeholder && preparation.attachIcon(icon.path, icon.size, IconOwner::install)) {
    configurePlaceholder(preparation);
  }
  const bool handedOver =
      preparation.report(preparation.coordinator->setPlaceholderPromise(preparation.placeholder),
                         "%s|added placeholder promise to coordinator for %{public}@",
                         "%s|Error %{public}@ adding placeholder promise to coordinator for '%{public}@'");
  if (handedOver) preparation.placeholder.reset();
  return handedOver;
}

/// Cancels everything that the preparation has made.
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
