// Text encodings of documents. All text in values is UTF-8.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::plist {

enum class ByteOrder { big, little };

/// Whether XML 1.0 allows the character.
[[nodiscard]] constexpr bool isXMLCharacter(char32_t c) noexcept {
  return c == 0x9 || c == 0xA || c == 0xD || (c >= 0x20 && c <= 0xD7FF) || (c >= 0xE000 && c <= 0xFFFD) ||
         (c >= 0x10000 && c <= 0x10FFFF);
}

[[nodiscard]] constexpr bool isSurrogate(char32_t c) noexcept {
  return c >= 0xD800 && c <= 0xDFFF;
}
[[nodiscard]] constexpr bool isHighSurrogate(char32_t c) noexcept {
  return c >= 0xD800 && c <= 0xDBFF;
}
[[nodiscard]] constexpr bool isLowSurrogate(char32_t c) noexcept {
  return c >= 0xDC00 && c <= 0xDFFF;
}
[[nodiscard]] constexpr char32_t joinSurrogates(char32_t high, char32_t low) noexcept {
  return 0x10000 + ((high - 0xD800) << 10) + (low - 0xDC00);
}

/// Writes UTF-8 as big-endian UTF-16: two bytes for each unit, and at most as many units as `text` has bytes. Returns
/// the end of the written bytes, or null if `text` is not well-formed.
[[nodiscard]] std::byte* writeUTF16(std::string_view text, std::byte* out) noexcept;

/// Appends UTF-16 as UTF-8. Returns the offset of the first lone surrogate or odd byte, or nullopt on success.
[[nodiscard]] std::optional<std::size_t> appendUTF16(std::string& out, ByteView units, ByteOrder order);

/// Returns the document as UTF-8 without a byte-order mark: a view of the document itself, or of `converted` if the
/// document is UTF-16, which its byte-order mark or its first two bytes show. Fails on malformed text.
[[nodiscard]] Result<std::string_view> decodeText(ByteView document, std::string& converted);

}  // namespace appsync::plist
