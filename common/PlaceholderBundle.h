// A placeholder bundle: its info dictionary, its icon, and its installation.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "common/PlugInLog.h"
#include "platform/FileSystem.h"
#include "platform/InstallTypes.h"
#include "platform/Platform.h"
#include "platform/SyncFiles.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Owner and group of placeholder bundles.
inline const platform::OwnerAttributes kMobileOwner{"mobile", "mobile"};

/// Keys that are copied from a host's info dictionary or store metadata.
inline constexpr std::string_view kPeriodicalKey = "UIPeriodixApp";

/// Logged with the identifier and the info dictionary of a placeholder bundle.
inline constexpr PlugInLog::Format<std::string, plist::Value> kCreatingPlaceholder =
    "%s|creating placeholder for '%{public}@'. info.plist=%{public}@";

/// The description of one placeholder.
struct PlaceholderInfo {
  std::string bundleIdentifier;
  const plist::Value* version = nullptr;        ///< null if the app has none
  std::optional<std::string> displayName = {};  ///< if nullopt, a null is stored and writing Info.plist fails
  plist::Value isPeriodical = false;
  bool isLaunchProhibited = false;

  /// Returns the seven entries of its "Info.plist"; six without a version.
  [[nodiscard]] plist::Dictionary dictionary() const;
  /// Returns the install options that every placeholder needs.
  [[nodiscard]] plist::Dictionary installOptions(platform::TSInstallType type) const;
};

// Paths in the placeholder bundle in `folder`.
[[nodiscard]] std::string placeholderInfoPath(std::string_view folder);
[[nodiscard]] std::string placeholderIconPath(std::string_view folder);

/// Copies the file at `source` to `icon`, and replaces an earlier icon there. An earlier icon survives a failure,
/// unless the copy fails once more after the removal of that icon.
[[nodiscard]] Status copyPlaceholderIcon(platform::FileSystem& files, std::string_view source, std::string_view icon);

/// Installs the bundle in `folder`. Logs the outcome, also under `scenario` in the transaction log, and returns it.
bool installPlaceholder(platform::Platform& platform, const std::string& folder, const PlaceholderInfo& placeholder,
                        std::string_view scenario, const plist::Dictionary& options, const PlugInLog& log);

}  // namespace appsync
