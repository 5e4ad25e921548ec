// Paths in the plug-in's scratch folders that are made of identifiers.
#pragma once

#include <string_view>

namespace appsync {

/// Whether a path that was made of a folder and an identifier leads out of that folder: identifiers are untrusted, and
/// may begin with "../".
[[nodiscard]] constexpr bool leavesItsFolder(std::string_view path) {
  return path.find("/../") != std::string_view::npos;
}

}  // namespace appsync
