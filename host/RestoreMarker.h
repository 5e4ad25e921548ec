// What a device remembers of a restore that is under way.
#pragma once

#include <optional>
#include <string>

#include "base/Error.h"

namespace appsync::host {

/// The identifier of the backup that is being restored to the device in this folder; none when none is. Kept in
/// "restore.plist".
[[nodiscard]] std::optional<std::string> restoreUnderWay(const std::string& devicePath);
/// Both take effect in one step.
[[nodiscard]] Status beginRestore(const std::string& devicePath, const std::string& backupIdentifier);
[[nodiscard]] Status endRestore(const std::string& devicePath);

}  // namespace appsync::host
