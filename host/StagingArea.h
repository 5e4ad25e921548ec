// The host's side of the folder through which host and plug-in meet.
#pragma once

#include <string>
#include <vector>

#include "base/Error.h"
#include "device/Device.h"
#include "host/SyncPlan.h"

namespace appsync::host {

/// Where the packages of a sync are put, beside the staging folder; relative to the public staging folder.
inline constexpr std::string_view kPackagesFolder = "ApplicationPackages";

/// Writes what the device has to know before the packages come: the todo list, the icon layout with new apps at its
/// end, and of each app that is to come its info dictionary, icon, store metadata and artwork, in a folder named by its
/// identifier. What an earlier sync left in the staging folder goes first.
///
/// Errors: those of the device's file system, each with what to do. Of a package that cannot be read only its app's
/// folder is left out; the installer will say why.
[[nodiscard]] Status stage(device::Device& device, const std::vector<PlannedApp>& plan);

/// Removes everything that was staged and sent and is not in use any more.
void clearStaging(device::Device& device);

}  // namespace appsync::host
