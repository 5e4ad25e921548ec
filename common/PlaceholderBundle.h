// The info dictionary of a placeholder bundle.
#pragma once

#include <optional>
#include <string>

#include "common/PlugInLog.h"
#include "platform/FileSystem.h"
#include "platform/InstallTypes.h"
#include "platform/SyncFiles.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Whose a placeholder bundle is.
inline const platform::OwnerAttributes kMobileOwner{"mobile", "mobile"};

/// Key that, like `kLaunchProhibitedKey`, a host's info dictionary or store metadata hands on to the placeholder.
inline constexpr std::string_view kPeriodicalKey = "UIPeriodixApp";

/// Said of a placeholder bundle with its info dictionary.
inline constexpr PlugInLog::Format<std::string, plist::Value> kCreatingPlaceholder =
    "%s|creating placeholder for '%{public}@'. info.plist=%{public}@";

/// What makes one placeholder differ from another.
struct PlaceholderInfo {
  std::string bundleIdentifier;
  const plist::Value* version = nullptr;        ///< null when there is none
  std::optional<std::string> displayName = {};  ///< an absent one makes a dictionary that cannot be written
  plist::Value isPeriodical = false;
  bool isLaunchProhibited = false;

  /// The seven entries of its "Info.plist"; without a version, six.
  [[nodiscard]] plist::Dictionary dictionary() const;
  /// What the installer has to be told of any placeholder.
  [[nodiscard]] plist::Dictionary installOptions(platform::TSInstallType type) const;
};

}  // namespace appsync
