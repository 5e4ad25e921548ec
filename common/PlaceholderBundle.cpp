#include "common/PlaceholderBundle.h"

#include <cerrno>

#include "platform/Keys.h"
#include "platform/SyncFiles.h"

namespace appsync {

namespace {

std::string pathIn(std::string_view folder, std::string_view name) {
  return std::string(folder).append("/").append(name);
}

}  // namespace

plist::Dictionary PlaceholderInfo::dictionary() const {
  const plist::Value name = displayName ? plist::Value(*displayName) : plist::Value();
  plist::Dictionary info{
      {platform::BundleIdentifierKey, bundleIdentifier},
      {platform::kBundleExecutableKey, name},  // There is no executable.
      {platform::kBundleDisplayNameKey, name},
      {platform::kBundleIconFileKey, kPlaceholderIconName},
      {kPeriodicalKey, isPeriodical},
      {kLaunchProhibitedKey, isLaunchProhibited},
  };
  if (version != nullptr) info.set(platform::kBundleVersionKey, *version);
  return info;
}

plist::Dictionary PlaceholderInfo::installOptions(platform::TSInstallType type) const {
  return {{platform::PackageTypeKey, platform::PackageTypePlaceholder},
          {platform::BundleIdentifierKey, bundleIdentifier},
          {platform::kInstallTypeKey, static_cast<std::uint64_t>(type)}};
}

std::string placeholderInfoPath(std::string_view folder) {
  return pathIn(folder, kInfoPlistName);
}

std::string placeholderIconPath(std::string_view folder) {
  return pathIn(folder, kPlaceholderIconName);
}

Status copyPlaceholderIcon(platform::FileSystem& files, std::string_view source, std::string_view icon) {
  Status copied = files.copyItem(source, icon);
  const bool isInTheWay = !copied && copied.error().domain == domains::kPOSIX && copied.error().code == EEXIST;
  if (!isInTheWay || !files.fileExists(source)) return copied;
  files.removeItem(icon).ignore();
  return files.copyItem(source, icon);
}

bool installPlaceholder(platform::Platform& platform, const std::string& folder, const PlaceholderInfo& placeholder,
                        std::string_view scenario, const plist::Dictionary& options, const PlugInLog& log) {
  const std::string& identifier = placeholder.bundleIdentifier;
  const Status installed = platform.defaultRegistry().installApplication(platform::FileLocation{folder, true}, options);
  if (installed) {
    log.message(
        "%s|Installed Placeholder app from path %{public}@: %{public}@ [%{public}@ %{public}@] [isPeriodix: %{public}@]",
        folder, placeholder.displayName, identifier, placeholder.version, placeholder.isPeriodical);
  } else {
    log.error(
        "%s|Placeholder app install failed from path %{public}@: %{public}@ [%{public}@ %{public}@] [isPeriodix: %{public}@]",
        folder, placeholder.displayName, identifier, placeholder.version, placeholder.isPeriodical);
  }
  platform.transactionLog().logScenario(scenario, 0, installed.ok(), identifier,
                                        installed ? "Installed placeholder" : "Failed to install placeholder");
  return installed.ok();
}

}  // namespace appsync
