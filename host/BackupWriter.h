// Creates backups.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/Device.h"
#include "host/Backup.h"

namespace appsync::host {

/// Saves the icon order and, of each of the device's user apps except those that a sync is installing, the store
/// metadata, licence, icon, data, version and demotion. The directory at `path` is created atomically and is read back
/// before that. Returns the content of its manifest; on failure nothing is left at `path`.
[[nodiscard]] Result<Backup> writeBackup(device::Device& device, const std::string& path);

}  // namespace appsync::host
