#include "base/MessageFormat.h"

#include <charconv>
#include <cstdint>
#include <cstring>
#include <iterator>
#include <limits>

#include "base/UTF8.h"

namespace appsync::detail {

namespace {

/// Tests eight bytes at a time: nearly all text is printable ASCII, and every message is tested.
bool isPrintableASCII(const char* at, std::size_t size) noexcept {
  constexpr std::uint64_t kEach = 0x0101010101010101U;
  std::uint64_t unprintable = 0;
  for (; size >= sizeof(std::uint64_t); size -= sizeof(std::uint64_t), at += sizeof(std::uint64_t)) {
    std::uint64_t word;
    std::memcpy(&word, at, sizeof word);
    // The high bit of each byte: set in the byte itself, after adding 1 to DEL, and not after adding 0x60 to a control.
    unprintable |= word | (word + kEach) | ~(word + kEach * 0x60);
  }
  bool isPrintable = (unprintable & kEach * 0x80) == 0;
  for (; size > 0; --size, ++at)
    isPrintable = isPrintable && *at >= ' ' && *at < '\x7F';
  return isPrintable;
}

void appendEscaped(std::string& out, char byte) {
  constexpr std::string_view kDigits = "0123456789abcdef";
  const auto code = static_cast<unsigned char>(byte);
  if (byte == '\n') {
    out += "\\n";
  } else {
    out += {'\\', 'x', kDigits[code >> 4U], kDigits[code & 15U]};
  }
}

}  // namespace

char appendUpToConversion(std::string& out, const char*& text) {
  while (true) {
    const std::size_t literal = std::strcspn(text, "%");
    out.append(text, literal);
    text += literal;
    if (*text == '\0') return '\0';
    ++text;
    if (*text == '{') text = std::strchr(text, '@');
    while (*text == 'l')
      ++text;
    const char letter = *text++;
    if (letter != '%') return letter;
    out += letter;
  }
}

void appendFixed(std::string& out, double value) {
  constexpr int kDigits = 6;
  constexpr std::size_t kLongest = std::numeric_limits<double>::max_exponent10 + kDigits + sizeof "-0.";
  char digits[kLongest];
  const auto end = std::to_chars(digits, std::end(digits), value, std::chars_format::fixed, kDigits);
  out.append(digits, end.ptr);
}

void escapeFrom(std::string& out, std::size_t start) {
  if (isPrintableASCII(out.data() + start, out.size() - start)) return;
  const std::string unescaped = out.substr(start);
  out.resize(start);
  for (std::string_view text = unescaped; !text.empty();) {
    const Character character = firstCharacter(text);
    const std::string_view bytes = text.substr(0, character.length);
    if (character.valid && !isUnsafeForDisplay(character.code)) {
      out += bytes;
    } else {
      for (const char byte : bytes)
        appendEscaped(out, byte);
    }
    text.remove_prefix(bytes.size());
  }
}

}  // namespace appsync::detail
