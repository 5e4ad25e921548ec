// The info dictionary of a placeholder bundle.
#pragma once

#include <string>

#include "base/PropertyList.h"
#include "platform/FileSystem.h"

namespace appsync {

/// The name of the icon file in a placeholder bundle.
inline constexpr std::string_view kPlaceholderIconName = "Icon.png";

/// Whose a placeholder bundle is.
inline const platform::OwnerAttributes kMobileOwner{"mobile", "mobile"};

/// Keys that a host's info dictionary or store metadata hands on to the placeholder.
inline constexpr std::string_view kPeriodicalKey = "UIPeriodixApp";
inline constexpr std::string_view kLaunchProhibitedKey = "TSApplicationLaunchProhibited";

/// What makes one placeholder differ from another.
struct PlaceholderInfo {
  std::string bundleIdentifier;
  const plist::Value* version = nullptr;  ///< null when there is none
  std::string displayName;
  plist::Value isPeriodical = false;
  bool isLaunchProhibited = false;

  /// The seven entries of its "Info.plist"; without a version, six.
  [[nodiscard]] plist::Dictionary dictionary() const;
};

}  // namespace appsync
