// The placeholder of a restored app for the install-coordination service.
#include "common/PlaceholderBundle.h"
#include "common/SyncError.h"
#include "coordination/Preparation.h"
#include "core/AppsClient.h"
#include "plist/Access.h"
#include "restore/RestoreMetadata.h"

namespace appsync {

namespace {

using platform::Placeholder;
using platform::TSInstallType;

TSInstallType installTypeFor(DemotionStatus status) {
  switch (status) {
    case DemotionStatus::intentionallyDemoted:
      return TSInstallType::IntentionalDowngrade;
    case DemotionStatus::automaticallyDemoted:
      return TSInstallType::Downgrade;
    default:
      return TSInstallType::Restore;
  }
}

bool setAttributes(CoordinatedPreparation& preparation, const RestoreMetadata& metadata) {
  platform::PlaceholderAttributes attributes;
  attributes.setLaunchProhibited(metadata.isLaunchProhibited());
  attributes.setBundleVersion(ownedStringIn(metadata.bundleVersion()));
  const Status set = preparation.placeholder->setPlaceholderAttributes(attributes);
  if (set) {
    preparation.log.message("%s|set %{public}@ placeholder attributes for %{public}@", attributes,
                            preparation.identifier);
  } else {
    preparation.log.error("%s|Error %{public}@ setting placeholder attributes for '%{public}@'", set.error(),
                          preparation.identifier);
  }
  return set.ok();
}

bool setStoreMetadata(CoordinatedPreparation& preparation, const plist::Dictionary& metadata) {
  return preparation.report(preparation.placeholder->setMetadata(platform::StoreMetadata::initWithDictionary(metadata)),
                            "%s|set store metadata on placeholder for %{public}@",
                            "%s|Error %{public}@ setting store metadata for '%{public}@'");
}

/// Returns true also without a licence.
bool setLicence(CoordinatedPreparation& preparation, const std::optional<ByteView>& sinf) {
  return !sinf || preparation.report(preparation.placeholder->setSinfData(*sinf),
                                     "%s|set SINF data on placeholder for %{public}@",
                                     "%s|Error %{public}@ setting SINF data for '%{public}@'");
}

bool completeConfiguration(CoordinatedPreparation& preparation) {
  return preparation.report(preparation.placeholder->setConfigurationComplete(),
                            "%s|set placeholder configuration complete for %{public}@",
                            "%s|Error %{public}@ setting placeholder configuration as complete for '%{public}@'");
}

}  // namespace

std::shared_ptr<Placeholder> AppsClient::_placeHolderForBundleIdentifierWithHarvoMetadata(
    std::string_view bundleIdentifier, const plist::Dictionary& harvoMetadata, const std::optional<ByteView>& sinfData,
    const std::optional<ByteView>& iconData, DemotionStatus demotionStatus) {
  CoordinatedPreparation preparation{*this, _platform, _log, std::string(bundleIdentifier)};
  const std::string& identifier = preparation.identifier;
  const RestoreMetadata metadata(harvoMetadata);

  const std::string folder = placeholderAppPathForBundleIdentifier(identifier);
  if (!createPlaceHolderPath(folder, identifier, kMobileOwner)) return nullptr;
  const std::string icon = placeholderIconPath(folder);
  std::uint64_t iconSize = 0;
  writeIconData(iconData, icon, &iconSize, identifier, kMobileOwner);

  preparation.placeholder = _placeHolderForBundleIdentifier(identifier, metadata.displayName().value_or(identifier),
                                                            installTypeFor(demotionStatus));
  if (!preparation.placeholder) return nullptr;
  if (preparation.attachIcon(icon, iconSize, IconOwner::restore) && setAttributes(preparation, metadata) &&
      setStoreMetadata(preparation, harvoMetadata) && setLicence(preparation, sinfData) &&
      completeConfiguration(preparation)) {
    return preparation.placeholder;
  }
  preparation.placeholder
      ->cancelForReason(syncError(SyncFailure::restoreGivenUp), platform::ClientIdentity::CXClientSync)
      .ignore();
  return nullptr;
}

}  // namespace appsync
