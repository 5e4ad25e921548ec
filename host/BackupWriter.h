// Makes backups.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/Device.h"
#include "host/Backup.h"

namespace appsync::host {

/// Saves of each of the device's user apps, but for those that a sync is about to bring, its store metadata, licence,
/// icon and data, its version, and whether it is demoted, and the order of the icons. The folder at `path` is whole or
/// not there, whatever ends the process; it is read back before it gets its name. Returns what its manifest says.
[[nodiscard]] Result<Backup> writeBackup(device::Device& device, const std::string& path);

}  // namespace appsync::host
