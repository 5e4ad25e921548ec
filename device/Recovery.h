// Recovers a device after a crash or power failure.
#pragma once

#include "base/Error.h"
#include "device/services/Settings.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"

namespace appsync::device {

/// Requires exclusive access to the device, with none of its services running. Removes
/// - the content of the work and temporary directories, and every container without a record;
/// - records of missing containers;
/// - if install coordination is off, the coordinators of a sync with their placeholders and packages;
/// - placeholders of a sync (install type 4) without a coordinator, so that their apps are requested again, but not the
///   apps under them;
/// - the data of removed apps, and data that a restore had not kept completely;
/// - packages that the coordination service had yet to delete.
/// The installs of other placeholders wait to be resumed. Idempotent and crash-safe.
[[nodiscard]] Status recover(Database& database, DeviceFileSystem& files, Settings& settings);

}  // namespace appsync::device
