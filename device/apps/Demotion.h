// Demoted apps, of which a device keeps only the icon and the data.
#pragma once

#include "base/Error.h"
#include "device/apps/AppRegistry.h"
#include "device/storage/DeviceFileSystem.h"
#include "platform/InstallTypes.h"

namespace appsync::device {

/// The backup service's list of demoted apps: a dictionary of two arrays of bundle identifiers.
inline constexpr std::string_view kDemotedAppsPath =
    "/var/mobile/Library/Preferences/com.corvel.Vaultory.DemotedApps.plist";
inline constexpr std::string_view kAutomaticDowngradesKey = "AutomaticDowngrades";
inline constexpr std::string_view kIntentionalDowngradesKey = "IntentionalDowngrades";

/// Returns the content of the list, from the placeholders of demoted apps in the registry.
[[nodiscard]] Result<plist::Dictionary> demotedApps(AppRegistry& registry);

/// Writes the list from the registry.
[[nodiscard]] Status recordDemotedApps(AppRegistry& registry, DeviceFileSystem& files);

/// Demotes an app as `AppRegistry::demote` does and updates the list.
[[nodiscard]] Status demote(AppRegistry& registry, DeviceFileSystem& files, std::string_view bundleIdentifier,
                            platform::TSInstallType type);

}  // namespace appsync::device
