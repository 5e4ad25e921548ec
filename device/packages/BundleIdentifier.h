// The syntax of bundle identifiers on this device.
#pragma once

#include <algorithm>
#include <string_view>

namespace appsync::device {

/// Returns whether `text` consists of 1 to 200 ASCII letters, digits, '-', '.' and '_' and does not start with a dot,
/// so that it can be a file name.
[[nodiscard]] constexpr bool isBundleIdentifier(std::string_view text) noexcept {
  constexpr std::size_t kLongest = 200;
  constexpr auto isAllowed = [](char letter) {
    return (letter >= 'a' && letter <= 'z') || (letter >= 'A' && letter <= 'Z') || (letter >= '0' && letter <= '9') ||
           letter == '-' || letter == '.' || letter == '_';
  };
  return !text.empty() && text.size() <= kLongest && text.front() != '.' && std::ranges::all_of(text, isAllowed);
}

}  // namespace appsync::device
