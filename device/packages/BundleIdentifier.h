// What a bundle identifier may look like on this device.
#pragma once

#include <algorithm>
#include <string_view>

namespace appsync::device {

/// ASCII letters, digits, '-', '.' and '_', not starting with a dot, and short enough for a file name.
[[nodiscard]] constexpr bool isBundleIdentifier(std::string_view text) noexcept {
  constexpr std::size_t kLongest = 200;
  constexpr auto isAllowed = [](char letter) {
    return (letter >= 'a' && letter <= 'z') || (letter >= 'A' && letter <= 'Z') || (letter >= '0' && letter <= '9') ||
           letter == '-' || letter == '.' || letter == '_';
  };
  return !text.empty() && text.size() <= kLongest && text.front() != '.' && std::ranges::all_of(text, isAllowed);
}

}  // namespace appsync::device
