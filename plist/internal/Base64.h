// Base64, the encoding of data in the XML format.
#pragma once

#include <cstddef>
#include <optional>
#include <string_view>

#include "base/Bytes.h"

namespace appsync::plist {

/// Returns the number of characters that encode `size` bytes.
[[nodiscard]] constexpr std::size_t base64Length(std::size_t size) noexcept {
  return (size + 2) / 3 * 4;
}

/// Writes `bytes` as Base64 with padding. Returns the end of the written characters.
char* writeBase64(ByteView bytes, char* out) noexcept;

/// Decodes Base64, ignoring white space, into `bytes`. Returns nullopt on success, else the offset of the first invalid
/// character, or the length of the text if it ends within a group.
[[nodiscard]] std::optional<std::size_t> decodeBase64(std::string_view text, Bytes& bytes);

}  // namespace appsync::plist
