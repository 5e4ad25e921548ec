// UTF-8: the only decoder and encoder of this repository.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>

namespace appsync {

/// Tests eight bytes at a time: most text is ASCII, and this is how readers find out.
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

/// Returns the length, 1 to 4, of the well-formed sequence at the start of `text`, or 0 if there is none.
[[nodiscard]] std::size_t sequenceLength(std::string_view text) noexcept;

/// Decodes the well-formed sequence of `length` bytes at `text`.
[[nodiscard]] char32_t decodeSequence(const char* text, std::size_t length) noexcept;

/// Returns the offset of the first byte that is not part of a well-formed sequence, or nullopt if all of `text` is
/// UTF-8.
[[nodiscard]] std::optional<std::size_t> findMalformedUTF8(std::string_view text) noexcept;

/// One character of a text from outside, or one byte that is not part of a well-formed sequence.
struct Character {
  char32_t code = 0;  ///< The byte, if not `valid`.
  std::size_t length = 1;
  bool valid = false;
};

/// Decodes the character at the start of `text`, which is not empty.
[[nodiscard]] Character firstCharacter(std::string_view text) noexcept;

/// Whether a terminal obeys the character, or it is invisible and makes text look like other text: control characters
/// (C0, DEL, C1), separators of lines and paragraphs, bidirectional controls, zero-width characters, tags.
[[nodiscard]] bool isUnsafeForDisplay(char32_t code) noexcept;

/// Writes a character, which is no surrogate, in up to four bytes. Returns the end of the written bytes.
char* writeCharacter(char32_t c, char* out) noexcept;

/// Appends a character, which is no surrogate.
void appendCharacter(std::string& out, char32_t c);

}  // namespace appsync
