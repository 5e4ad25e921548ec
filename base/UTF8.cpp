#include "base/UTF8.h"

#include <algorithm>

namespace appsync {

namespace {

constexpr unsigned byteAt(std::string_view text, std::size_t i) noexcept {
  return static_cast<unsigned char>(text[i]);
}

bool continues(std::string_view text, std::size_t i) noexcept {
  return i < text.size() && (byteAt(text, i) & 0xC0U) == 0x80U;
}

}  // namespace

std::size_t sequenceLength(std::string_view text) noexcept {
  if (text.empty()) return 0;
  const unsigned lead = byteAt(text, 0);
  if (lead < 0x80) return 1;
  if (lead < 0xC2 || lead > 0xF4 || !continues(text, 1)) return 0;
  if (lead < 0xE0) return 2;
  const unsigned second = byteAt(text, 1);
  if (lead < 0xF0) {
    const bool isOverlong = lead == 0xE0 && second < 0xA0;
    const bool isLoneSurrogate = lead == 0xED && second >= 0xA0;
    return isOverlong || isLoneSurrogate || !continues(text, 2) ? 0 : 3;
  }
  const bool isOverlong = lead == 0xF0 && second < 0x90;
  const bool isBeyondUnicode = lead == 0xF4 && second >= 0x90;
  return isOverlong || isBeyondUnicode || !continues(text, 2) || !continues(text, 3) ? 0 : 4;
}

char32_t decodeSequence(const char* text, std::size_t length) noexcept {
  const auto bits = [&](std::size_t i) { return static_cast<char32_t>(static_cast<unsigned char>(text[i]) & 0x3FU); };
  const auto lead = static_cast<char32_t>(static_cast<unsigned char>(text[0]));
  switch (length) {
    case 1:
      return lead;
    case 2:
      return (lead & 0x1F) << 6 | bits(1);
    case 3:
      return (lead & 0xF) << 12 | bits(1) << 6 | bits(2);
    default:
      return (lead & 0x7) << 18 | bits(1) << 12 | bits(2) << 6 | bits(3);
  }
}

std::optional<std::size_t> findMalformedUTF8(std::string_view text) noexcept {
  constexpr std::size_t kBlock = 32;
  std::size_t at = 0;
  while (at < text.size()) {
    if (isASCII(text.substr(at, kBlock))) {
      at += kBlock;
      continue;
    }
    for (const std::size_t blockEnd = std::min(at + kBlock, text.size()); at < blockEnd;) {
      const std::size_t length = sequenceLength(text.substr(at));
      if (length == 0) return at;
      at += length;
    }
  }
  return std::nullopt;
}

Character firstCharacter(std::string_view text) noexcept {
  const std::size_t length = sequenceLength(text);
  if (length == 0) return {byteAt(text, 0)};
  return {decodeSequence(text.data(), length), length, true};
}

bool isUnsafeForDisplay(char32_t code) noexcept {
  return code < 0x20 || (code >= 0x7F && code <= 0x9F) || code == 0xAD || code == 0x61C ||
         (code >= 0x200B && code <= 0x200F && code != 0x200D) || (code >= 0x2028 && code <= 0x202E) ||
         (code >= 0x2060 && code <= 0x206F) || code == 0xFEFF || (code >= 0xFFF0 && code <= 0xFFFB) ||
         (code >= 0xE0000 && code <= 0xE0FFF);
}

char* writeCharacter(char32_t c, char* out) noexcept {
  const auto push = [&](char32_t byte) { *out++ = static_cast<char>(static_cast<unsigned char>(byte)); };
  if (c < 0x80) {
    push(c);
    return out;
  }
  if (c < 0x800) {
    push(0xC0 | c >> 6);
  } else if (c < 0x10000) {
    push(0xE0 | c >> 12);
    push(0x80 | (c >> 6 & 0x3F));
  } else {
    push(0xF0 | c >> 18);
    push(0x80 | (c >> 12 & 0x3F));
    push(0x80 | (c >> 6 & 0x3F));
  }
  push(0x80 | (c & 0x3F));
  return out;
}

void appendCharacter(std::string& out, char32_t c) {
  char bytes[4];
  out.append(bytes, writeCharacter(c, bytes));
}

}  // namespace appsync
