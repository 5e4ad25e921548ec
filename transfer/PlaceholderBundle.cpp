// Placeholder apps: bundles on disk with a name, a version and an icon, but no code.
#include "common/PlaceholderBundle.h"

#include <cerrno>

#include "common/PropertyListFile.h"
#include "core/AppsClient.h"
#include "plist/Access.h"
#include "transfer/ScratchPath.h"

namespace appsync {

namespace {

PlaceholderInfo describePlaceholder(const platform::ZTAsset& asset, const plist::Value& hostInfo) {
  const plist::Value* isPeriodical = hostInfo.find(kPeriodicalKey);
  return {.bundleIdentifier = asset.identifier(),
          .version = asset.version(),
          .displayName = asset.prettyName(),
          .isPeriodical = isPeriodical == nullptr ? plist::Value(false) : *isPeriodical,
          .isLaunchProhibited = booleanIn(hostInfo.find(kLaunchProhibitedKey))};
}

}  // namespace

std::string AppsClient::placeholderAppPathForBundleIdentifier(std::string_view bundleIdentifier) {
  return _platform.fileSystem().temporaryDirectory() + "/com.corvel.zeph.Apps/" + std::string(bundleIdentifier) +
         ".app";
}

bool AppsClient::createPlaceHolderPath(std::string_view path, std::string_view bundleIdentifier,
                                       const platform::OwnerAttributes& attributes) {
  const Status created = leavesItsFolder(path) ? Error::fromErrno(EINVAL)
                                               : _platform.fileSystem().createDirectory(
                                                     path, platform::IntermediateDirectories::create, attributes);
  if (!created) {
    // The scenario names a restore also for an install: readers of the log search for it.
    _platform.transactionLog().logScenario("Harvo App Restore", 0, false, bundleIdentifier,
                                           "Failed to create app directory");
  }
  _log.message("%s|Created app directory for '%{public}@' at %{public}@ with err=%{public}@", bundleIdentifier, path,
               created.failure());
  return created.ok();
}

bool AppsClient::writeIconData(const std::optional<ByteView>& icon, std::string_view path, std::uint64_t* fileSize,
                               std::string_view bundleIdentifier, const platform::OwnerAttributes& attributes) {
  if (!icon) {
    _log.error("%s|no icon data for '%{public}@'", bundleIdentifier);
    return false;
  }
  platform::FileSystem& files = _platform.fileSystem();
  const bool created = files.createFile(path, *icon, attributes).ok();
  std::uint64_t size = 0;
  if (created) {
    if (const auto written = files.attributesOfItem(path)) {
      size = written->size;
      if (fileSize != nullptr) *fileSize = size;
    }
  }
  _log.message("%s|icon data for '%{public}@' was writen to %{public}@ with status:%d fileSize:%llu", bundleIdentifier,
               path, created, size);
  return created;
}

void AppsClient::_createPlaceHolderApplication(const platform::ZTAsset& asset) {
  const std::string& identifier = asset.identifier();
  platform::FileSystem& files = _platform.fileSystem();
  _log.message("%s|plist %{public}@", asset.infoPlist());
  const PlaceholderInfo placeholder = describePlaceholder(asset, readDictionary(files, asset.infoPlist()));
  if (placeholder.displayName.value_or("").empty() || identifier.empty()) return;

  const std::string folder = placeholderAppPathForBundleIdentifier(identifier);
  if (!createPlaceHolderPath(folder, identifier, kMobileOwner)) return;
  if (asset.icon()) {
    const std::string icon = placeholderIconPath(folder);
    const Status copied = copyPlaceholderIcon(files, asset.icon()->path, icon);
    if (!copied) {
      _log.error("%s|Copying icon from %{public}@ to %{public}@ failed: %{public}@", asset.icon()->path, icon,
                 copied.error());
    }
  }
  const plist::Value info = placeholder.dictionary();
  if (!writePropertyList(files, placeholderInfoPath(folder), info)) return;
  _log.message(kCreatingPlaceholder, identifier, info);
  installPlaceholder(_platform, folder, placeholder, "Install placeholder",
                     placeholder.installOptions(platform::TSInstallType::Sync), _log);
}

}  // namespace appsync
