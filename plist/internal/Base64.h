// Base64, as the XML form writes data.
#pragma once

#include <cstddef>
#include <optional>
#include <string_view>

#include "base/Bytes.h"

namespace appsync::plist {

/// How many characters `size` bytes take.
[[nodiscard]] constexpr std::size_t base64Length(std::size_t size) noexcept {
  return (size + 2) / 3 * 4;
}

/// Writes `bytes` as Base64 with padding. Returns the end of what was written.
char* writeBase64(ByteView bytes, char* out) noexcept;

/// Decodes Base64 with any white space between, into `bytes`. Yields the offset of the first character that does not
/// belong there, or the text's length when it ends within a group; none on success.
[[nodiscard]] std::optional<std::size_t> decodeBase64(std::string_view text, Bytes& bytes);

}  // namespace appsync::plist
