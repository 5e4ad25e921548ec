#include "common/PlaceholderBundle.h"

#include "common/PlaceholderIcon.h"
#include "platform/Keys.h"

namespace appsync {

plist::Dictionary PlaceholderInfo::dictionary() const {
  const plist::Value name = displayName ? plist::Value(*displayName) : plist::Value();
  plist::Dictionary info{
      {platform::BundleIdentifierKey, bundleIdentifier},
      {platform::kBundleExecutableKey, name},  // There is no code: the name has to serve.
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

}  // namespace appsync
