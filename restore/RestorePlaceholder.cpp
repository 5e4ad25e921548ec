// The placeholder of a restored app where installs are not coordinated: a bundle of the plug-in's own making.
#include "common/PlaceholderBundle.h"
#include "common/PlaceholderIcon.h"
#include "common/PropertyListFile.h"
#include "core/AppsClient.h"
#include "platform/Keys.h"
#include "platform/SyncFiles.h"
#include "restore/RestoreMetadata.h"

namespace appsync {

namespace {

constexpr std::string_view kScenario = "Harvo App Restore";

/// What is missing is an explicit null, with which the info dictionary cannot be written: an app without a name or a
/// version gets no placeholder.
PlaceholderInfo describePlaceholder(std::string_view identifier, const RestoreMetadata& metadata) {
  static const plist::Value kNone;
  const plist::Value* version = metadata.bundleVersion();
  return {.bundleIdentifier = std::string(identifier),
          .version = version == nullptr ? &kNone : version,
          .displayName = metadata.displayName(),
          .isPeriodical = metadata.isPeriodical(),
          .isLaunchProhibited = metadata.isLaunchProhibited()};
}

plist::Dictionary installOptions(const PlaceholderInfo& placeholder, ByteView metadata,
                                 const std::optional<ByteView>& sinf) {
  plist::Dictionary options = placeholder.installOptions(platform::TSInstallType::Restore);
  options.set(platform::kStoreMetadataKey, plist::Value::data(metadata));
  options.set(platform::kLicenceDataKey, sinf ? plist::Value::data(*sinf) : plist::Value());
  return options;
}

}  // namespace

bool AppsClient::_processHarvoRestoreInfoForApp(std::string_view bundleIdentifier, ByteView harvoMetaData,
                                                const std::optional<ByteView>& sinfData,
                                                const std::optional<ByteView>& iconData) {
  _log.message("%s|processing app restore info for '%{public}@'", bundleIdentifier);
  const auto metadata = dictionaryOf(plist::read(harvoMetaData));
  if (!metadata) {
    _log.message(kRestoreMetadataUnreadable, bundleIdentifier, metadata.error());
    _platform.transactionLog().logScenario(kScenario, 0, false, bundleIdentifier, "Failed to parse harvo metadata");
    return true;  // Trying again would not make it readable: the app counts as dealt with.
  }
  const PlaceholderInfo placeholder = describePlaceholder(bundleIdentifier, RestoreMetadata(*metadata));
  const std::string folder = placeholderAppPathForBundleIdentifier(bundleIdentifier);
  const bool isMade =
      _buildRestorePlaceholder(folder, placeholder, iconData) &&
      _installPlaceholder(folder, placeholder, kScenario, installOptions(placeholder, harvoMetaData, sinfData));
  if (!isMade) {
    _log.message("%s|failed to process app restore info for '%{public}@'. harvoMetadataDictionary=%{public}@",
                 bundleIdentifier, *metadata);
  }
  return isMade;
}

bool AppsClient::_buildRestorePlaceholder(const std::string& folder, const PlaceholderInfo& placeholder,
                                          const std::optional<ByteView>& icon) {
  const std::string& identifier = placeholder.bundleIdentifier;
  platform::TransactionLog& transactions = _platform.transactionLog();
  if (!createPlaceHolderPath(folder, identifier, kMobileOwner)) {
    // The cause was said where the folder was to be made.
    _log.message("%s|failed to create app directory for '%{public}@'. err=%{public}@", identifier,
                 std::optional<Error>());
    transactions.logScenario(kScenario, 0, false, identifier, "Failed to create app directory");
    return false;
  }
  writeIconData(icon, placeholderIconPath(folder), nullptr, identifier, kMobileOwner);

  const plist::Value info = placeholder.dictionary();
  const std::string path = folder + "/" + std::string(kInfoPlistName);
  _log.message(kCreatingPlaceholder, identifier, info);
  if (!writePropertyList(_platform.fileSystem(), path, info)) {
    _log.message("%s|failed to create placeholder info at %{public}@ with info %{public}@", path, info);
    transactions.logScenario(kScenario, 0, false, identifier, "Failed to create placeholder info");
    return false;
  }
  return true;
}

}  // namespace appsync
