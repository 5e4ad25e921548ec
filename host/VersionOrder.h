// The order of versions.
#pragma once

#include <compare>
#include <string_view>

namespace appsync::host {

/// Compares the components between the '.'s: first by the number at their start, which may have any length, then by the
/// text after it. Missing components count as 0, so "1.0" and "1.0.0" are equivalent.
[[nodiscard]] std::weak_ordering compareVersions(std::string_view left, std::string_view right);

}  // namespace appsync::host
