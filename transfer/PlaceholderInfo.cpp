#include "transfer/PlaceholderInfo.h"

#include "platform/Keys.h"

namespace appsync {

plist::Dictionary PlaceholderInfo::dictionary() const {
  plist::Dictionary info{
      {platform::BundleIdentifierKey, bundleIdentifier},
      {platform::BundleExecutableKey, displayName},  // There is no code: the name has to serve.
      {platform::BundleDisplayNameKey, displayName},
      {platform::BundleIconFileKey, kPlaceholderIconName},
      {kPeriodicalKey, isPeriodical},
      {kLaunchProhibitedKey, isLaunchProhibited},
  };
  if (version != nullptr) info.set(platform::BundleVersionKey, *version);
  return info;
}

}  // namespace appsync
