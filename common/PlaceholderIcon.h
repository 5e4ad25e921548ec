// The icon in a placeholder bundle.
#pragma once

#include <cerrno>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "platform/FileSystem.h"
#include "platform/SyncFiles.h"

namespace appsync {

/// Where the placeholder bundle in `folder` has it.
[[nodiscard]] inline std::string placeholderIconPath(std::string_view folder) {
  return std::string(folder).append("/").append(kPlaceholderIconName);
}

/// Copies the file at `source` there. Replaces the icon of an earlier placeholder only if there is a new one: after a
/// failed copy the earlier icon is still there, unless the copy failed once more after its removal.
[[nodiscard]] inline Status copyPlaceholderIcon(platform::FileSystem& files, std::string_view source,
                                                std::string_view icon) {
  Status copied = files.copyItem(source, icon);
  const bool isInTheWay = !copied && copied.error().domain == domains::kPOSIX && copied.error().code == EEXIST;
  if (!isInTheWay || !files.fileExists(source)) return copied;
  files.removeItem(icon).ignore();
  return files.copyItem(source, icon);
}

}  // namespace appsync
