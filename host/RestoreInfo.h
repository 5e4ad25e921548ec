// The host's restore file, from which the sync client reads the apps to restore.
#pragma once

#include "base/Error.h"
#include "host/Backup.h"
#include "plist/PropertyList.h"

namespace appsync::host {

/// Returns the entry of `app`: its store metadata, completed by the name and version of the manifest, its licence and
/// its icon. Fails if one of its files in the backup is missing or damaged.
[[nodiscard]] Result<plist::Dictionary> restoreInfoOf(const Backup& backup, const BackedUpApp& app);

}  // namespace appsync::host
