// Demoted apps, of which a device keeps only the icon and the data.
#pragma once

#include "base/Error.h"
#include "device/apps/AppRegistry.h"
#include "device/storage/DeviceFileSystem.h"
#include "platform/InstallTypes.h"

namespace appsync::device {

/// Returns the content of the demoted-apps file (platform/SyncFiles.h), from the placeholders of demoted apps in the
/// registry.
[[nodiscard]] Result<plist::Dictionary> demotedApps(AppRegistry& registry);

/// Writes that file from the registry.
[[nodiscard]] Status recordDemotedApps(AppRegistry& registry, DeviceFileSystem& files);

/// Demotes an app as `AppRegistry::demote` does and updates the file.
[[nodiscard]] Status demote(AppRegistry& registry, DeviceFileSystem& files, std::string_view bundleIdentifier,
                            platform::TSInstallType type);

}  // namespace appsync::device
