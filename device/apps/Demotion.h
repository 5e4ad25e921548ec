// Apps of which a device has kept the icon and the data only.
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

/// What the list has to say, from the placeholders of demoted apps that the registry has.
[[nodiscard]] Result<plist::Dictionary> demotedApps(AppRegistry& registry);

/// Brings the list in step with the registry.
[[nodiscard]] Status recordDemotedApps(AppRegistry& registry, DeviceFileSystem& files);

/// `AppRegistry::demote`, and the list.
[[nodiscard]] Status demote(AppRegistry& registry, DeviceFileSystem& files, std::string_view bundleIdentifier,
                            platform::TSInstallType type);

}  // namespace appsync::device
