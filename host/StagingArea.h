// The host's side of the staging folder, through which host and plug-in exchange files.
#pragma once

#include <string>
#include <vector>

#include "base/Error.h"
#include "device/Device.h"
#include "host/SyncPlan.h"

namespace appsync::host {

/// The folder for the packages of a sync, relative to the public staging folder.
inline constexpr std::string_view kPackagesFolder = "ApplicationPackages";

/// Writes the files that the plug-in needs before the packages: the todo list, the icon layout with new apps at its
/// end, and for each app to install its info dictionary, icon, store metadata and artwork, in a folder named after its
/// identifier. Removes the files of an earlier sync first.
///
/// Fails with the errors of the device's file system and then leaves nothing behind. For a package that cannot be read
/// only the app's folder is omitted; the installer reports the reason.
[[nodiscard]] Status stage(device::Device& device, const std::vector<PlannedApp>& plan);

/// Removes all staged files and sent packages. No sync may be running.
void clearStaging(device::Device& device);

}  // namespace appsync::host
