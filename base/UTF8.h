// The characters of a text from outside, and which of them must not reach a person as they are.
#pragma once

#include <cstddef>
#include <string_view>

namespace appsync::device {

/// One character of a text, or one byte that belongs to none.
struct Character {
  char32_t code = 0;
  std::size_t length = 1;
  bool valid = false;
};

/// The character at the start of `text`, UTF-8 that is not empty.
[[nodiscard]] Character firstCharacter(std::string_view text);

/// Whether a character commands a terminal, or is invisible and lets text pretend to be other text.
[[nodiscard]] bool isUnsafeForDisplay(char32_t code);

}  // namespace appsync::device
