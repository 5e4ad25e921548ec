// Paths that consist of a scratch folder and an untrusted identifier.
#pragma once

#include <string_view>

namespace appsync {

/// Whether such a path leads out of its folder: an identifier may begin with "../".
[[nodiscard]] constexpr bool leavesItsFolder(std::string_view path) {
  return path.find("/../") != std::string_view::npos;
}

}  // namespace appsync
