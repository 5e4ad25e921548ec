// The placeholder bundle of a restored app, if installs are not coordinated.
#include "common/PlaceholderBundle.h"
#include "common/PropertyListFile.h"
#include "core/AppsClient.h"
#include "platform/Keys.h"
#include "restore/RestoreMetadata.h"

namespace appsync {

namespace {

constexpr std::string_view kScenario = "Harvo App Restore";

PlaceholderInfo describePlaceholder(std::string_view identifier, const RestoreMetadata& metadata) {
  return {.bundleIdentifier = std::string(identifier),
          .version = metadata.bundleVersion(),
          .displayName = metadata.displayName(),
          .isPeriodical = metadata.isPeriodical(),
          .isLaunchProhibited = metadata.isLaunchProhibited()};
}

/// A missing version is a null, with which the dictionary cannot be written: a restored app needs a version.
plist::Dictionary infoDictionary(const PlaceholderInfo& placeholder) {
  plist::Dictionary info = placeholder.dictionary();
  if (placeholder.version == nullptr) info.set(platform::kBundleVersionKey, plist::Value());
  return info;
}

plist::Dictionary installOptions(const PlaceholderInfo& placeholder, ByteView metadata,
                                 const std::optional<ByteView>& sinf) {
  plist::Dictionary options = placeholder.installOptions(platform::TSInstallType::Restore);
  options.set(platform::kStoreMetadataKey, plist::Value::data(metadata));
  options.set(platform::kLicenceDataKey, sinf ? plist::Value::data(*sinf) : plist::Value());
  return options;
}

bool buildPlaceholder(AppsClient& client, platform::Platform& platform, const std::string& folder,
                      const PlaceholderInfo& placeholder, const std::optional<ByteView>& icon, const PlugInLog& log) {
  const std::string& identifier = placeholder.bundleIdentifier;
  platform::TransactionLog& transactions = platform.transactionLog();
  if (!client.createPlaceHolderPath(folder, identifier, kMobileOwner)) {
    // createPlaceHolderPath has logged the error.
    log.message("%s|failed to create app directory for '%{public}@'. err=%{public}@", identifier,
                std::optional<Error>());
    transactions.logScenario(kScenario, 0, false, identifier, "Failed to create app directory");
    return false;
  }
  client.writeIconData(icon, placeholderIconPath(folder), nullptr, identifier, kMobileOwner);

  const plist::Value info = infoDictionary(placeholder);
  const std::string path = placeholderInfoPath(folder);
  log.message(kCreatingPlaceholder, identifier, info);
  if (!writePropertyList(platform.fileSystem(), path, info)) {
    log.message("%s|failed to create placeholder info at %{public}@ with info %{public}@", path, info);
    transactions.logScenario(kScenario, 0, false, identifier, "Failed to create placeholder info");
    return false;
  }
  return true;
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
    return true;  // A retry cannot succeed.
  }
  const PlaceholderInfo placeholder = describePlaceholder(bundleIdentifier, RestoreMetadata(*metadata));
  const std::string folder = placeholderAppPathForBundleIdentifier(bundleIdentifier);
  const bool isMade = buildPlaceholder(*this, _platform, folder, placeholder, iconData, _log) &&
                      installPlaceholder(_platform, folder, placeholder, kScenario,
                                         installOptions(placeholder, harvoMetaData, sinfData), _log);
  if (!isMade) {
    _log.message("%s|failed to process app restore info for '%{public}@'. harvoMetadataDictionary=%{public}@",
                 bundleIdentifier, *metadata);
  }
  return isMade;
}

}  // namespace appsync
