// The placeholder of an app that is about to be installed through a coordinator.
#include "common/PlaceholderBundle.h"
#include "common/PlaceholderIcon.h"
#include "common/TransactionSteps.h"
#include "coordination/InstallPreparation.h"
#include "core/AppsClient.h"
#include "plist/Access.h"

namespace appsync {

namespace {

using platform::Placeholder;
using platform::TransactionStep;
using platform::TSInstallType;

/// An icon file that is the placeholder's own; `size` is 0 when there is none.
struct PlaceholderIcon {
  std::string path;
  std::uint64_t size = 0;
};

/// 0 when it is not known.
std::uint64_t sizeOnDisk(InstallPreparation& preparation, const std::string& icon) {
  const auto attributes = preparation.platform.fileSystem().attributesOfItem(icon);
  if (!attributes) preparation.error = attributes.error();
  const std::uint64_t size = attributes ? attributes->size : 0;
  preparation.log.message("%s|icon for %{public}@ at %{public}@ has a size of %llu", preparation.identifier, icon,
                          size);
  return size;
}

PlaceholderIcon provideIcon(InstallPreparation& preparation) {
  const std::string folder = preparation.client.placeholderAppPathForBundleIdentifier(preparation.identifier);
  PlaceholderIcon icon{placeholderIconPath(folder)};
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
  // A success whatever came of the copy: an app can do without an icon.
  endStep(transactions, TransactionStep::copyIcon, true, preparation.identifier, "Copying icon");
  return icon;
}

/// True without an icon too.
bool attachIcon(InstallPreparation& preparation, const PlaceholderIcon& icon) {
  return icon.size == 0 || preparation.client._createIconPromiseForBundleIdentifier(
                               preparation.identifier, icon.path, icon.size, preparation.placeholder, true) != nullptr;
}

/// What fails here is only missing on the home screen; each action waits for the one before it.
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

}  // namespace

bool providePlaceholder(InstallPreparation& preparation) {
  if (preparation.coordinator->hasPlaceholderPromise()) {
    preparation.log.message("%s|coordinator for %{public}@ has a placeholder promise", preparation.identifier);
    return true;
  }
  const PlaceholderIcon icon = provideIcon(preparation);
  preparation.placeholder = preparation.client._placeHolderForBundleIdentifier(
      preparation.identifier, preparation.asset.prettyName().value_or(preparation.identifier), TSInstallType::Sync);
  // With an icon that cannot be attached the placeholder stays unconfigured, and so unseen.
  if (preparation.placeholder && attachIcon(preparation, icon)) configurePlaceholder(preparation);
  const bool handedOver =
      preparation.report(preparation.coordinator->setPlaceholderPromise(preparation.placeholder),
                         "%s|added placeholder promise to coordinator for %{public}@",
                         "%s|Error %{public}@ adding placeholder promise to coordinator for '%{public}@'");
  if (handedOver) preparation.placeholder.reset();
  return handedOver;
}

}  // namespace appsync
