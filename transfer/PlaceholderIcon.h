// The icon in a placeholder bundle.
#pragma once

#include <string>
#include <string_view>

#include "base/Error.h"
#include "platform/FileSystem.h"

namespace appsync {

/// The name of its file.
inline constexpr std::string_view kPlaceholderIconName = "Icon.png";

/// Where the placeholder bundle in `folder` has it.
[[nodiscard]] inline std::string placeholderIconPath(std::string_view folder) {
  return std::string(folder).append("/").append(kPlaceholderIconName);
}

/// Copies the file at `source` there, in place of the icon that an earlier placeholder of the app has left.
[[nodiscard]] inline Status copyPlaceholderIcon(platform::FileSystem& files, std::string_view source,
                                                std::string_view icon) {
  files.removeItem(icon).ignore();
  return files.copyItem(source, icon);
}

}  // namespace appsync
