// Which of two versions is the newer.
#pragma once

#include <compare>
#include <string_view>

namespace appsync::host {

/// Compares component by component, split at '.': by the number that a component starts with, whatever its length, then
/// by the text after it. Absent components count as 0, so "1.0" and "1.0.0" are the same version.
[[nodiscard]] std::weak_ordering compareVersions(std::string_view left, std::string_view right);

}  // namespace appsync::host
