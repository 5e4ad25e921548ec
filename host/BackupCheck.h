// Checks that a backup can be restored.
#pragma once

#include <string>

#include "base/Error.h"
#include "host/Backup.h"

namespace appsync::host {

/// Reads the backup in the directory `path` as a restore does: its manifest must equal that of `written`, every file
/// must have its size, and the restore file made of them must be readable. Store metadata that the device itself cannot
/// read is accepted. Fails with the first difference.
[[nodiscard]] Status checkBackup(const std::string& path, const Backup& written);

}  // namespace appsync::host
