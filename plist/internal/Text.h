// Text encodings as property lists need them. All text in values is UTF-8.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>

#include "base/Bytes.h"

namespace appsync::plist {

enum class ByteOrder { big, little };

[[nodiscard]] inline bool isASCII(std::string_view text) noexcept {
  const char* at = text.data();
  std::size_t left = text.size();
  for (; left >= sizeof(std::uint64_t); left -= sizeof(std::uint64_t), at += sizeof(std::uint64_t)) {
    std::uint64_t word;
    std::memcpy(&word, at, sizeof word);
    if ((word & 0x8080808080808080U) != 0) return false;
  }
  for (; left > 0; --left, ++at) {
    if (static_cast<unsigned char>(*at) >= 0x80) return false;
  }
  return true;
}

/// The length, 1 to 4, of the well-formed UTF-8 sequence that `text` starts with; 0 when it starts with none.
[[nodiscard]] std::size_t sequenceLength(std::string_view text) noexcept;

/// The character that the well-formed sequence at `text` encodes.
[[nodiscard]] char32_t decodeSequence(const char* text, std::size_t length) noexcept;

/// Where the first byte that is not well-formed UTF-8 lies; none when all is well.
[[nodiscard]] std::optional<std::size_t> findMalformedUTF8(std::string_view text) noexcept;

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

/// Writes a character that is no surrogate, in up to four bytes. Returns the end of what was written.
char* writeCharacter(char32_t c, char* out) noexcept;

/// Appends a character that is no surrogate.
void appendCharacter(std::string& out, char32_t c);

/// Writes UTF-8 as big-endian UTF-16: two bytes for each unit, and no more units than there are bytes. Returns the end
/// of what was written; null when the text is not well-formed.
[[nodiscard]] std::byte* writeUTF16(std::string_view text, std::byte* out) noexcept;

/// Appends UTF-16 as UTF-8. Yields the offset of the first lone surrogate or odd byte, or none on success.
[[nodiscard]] std::optional<std::size_t> appendUTF16(std::string& out, ByteView units, ByteOrder order);

}  // namespace appsync::plist
