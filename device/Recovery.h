// Puts a device in order after a process that held it was cut off.
#pragma once

#include "base/Error.h"
#include "device/services/Settings.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"

namespace appsync::device {

/// Nobody else may hold the device, and none of its services may run yet. Afterwards
/// - nothing half done is left: the work folder, the temporary directory and every container without a record are gone;
/// - no record names a container that is not there;
/// - where install coordination is off, coordinators of a sync are gone with their placeholders and packages;
/// - placeholders of a sync (install type 4) that no coordinator owns are gone, so that their apps are offered again;
///   an app under one stays;
/// - data of removed apps is gone, and what a restore was just about to keep;
/// - packages that the coordination service was to remove are gone;
/// - the installs of other placeholders wait to be taken up again.
/// Doing it again changes nothing, and being cut off does not matter.
[[nodiscard]] Status recover(Database& database, DeviceFileSystem& files, Settings& settings);

}  // namespace appsync::device
