#include "plist/internal/Text.h"

#include <algorithm>

namespace appsync::plist {

namespace {

constexpr unsigned byteAt(std::string_view text, std::size_t i) noexcept {
  return static_cast<unsigned char>(text[i]);
}

bool continues(std::string_view text, std::size_t i) noexcept {
  return i < text.size() && (byteAt(text, i) & 0xC0U) == 0x80U;
}

char32_t unitAt(ByteView units, std::size_t i, ByteOrder order) noexcept {
  const auto first = std::to_integer<char32_t>(units[i]);
  const auto second = std::to_integer<char32_t>(units[i + 1]);
  return order == ByteOrder::big ? first << 8 | second : second << 8 | first;
}

std::byte* writeUnit(char32_t unit, std::byte* out) noexcept {
  out[0] = static_cast<std::byte>(unit >> 8);
  out[1] = static_cast<std::byte>(unit);
  return out + 2;
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

std::byte* writeUTF16(std::string_view text, std::byte* out) noexcept {
  for (std::size_t at = 0; at < text.size();) {
    if (const unsigned lead = byteAt(text, at); lead < 0x80) {
      out = writeUnit(lead, out);
      ++at;
      continue;
    }
    const std::size_t length = sequenceLength(text.substr(at));
    if (length == 0) return nullptr;
    const char32_t c = decodeSequence(text.data() + at, length);
    if (c >= 0x10000) {
      out = writeUnit(0xD800 + ((c - 0x10000) >> 10), out);
      out = writeUnit(0xDC00 + ((c - 0x10000) & 0x3FF), out);
    } else {
      out = writeUnit(c, out);
    }
    at += length;
  }
  return out;
}

std::optional<std::size_t> appendUTF16(std::string& out, ByteView units, ByteOrder order) {
  const std::size_t even = units.size() & ~std::size_t{1};
  const std::size_t start = out.size();
  // A unit becomes three bytes at most, a pair of surrogates four.
  out.resize(start + even / 2 * 3);
  char* end = out.data() + start;
  for (std::size_t at = 0; at < even; at += 2) {
    char32_t c = unitAt(units, at, order);
    if (c < 0x80) {
      *end++ = static_cast<char>(c);
      continue;
    }
    if (isSurrogate(c)) {
      const char32_t low = at + 2 < even ? unitAt(units, at + 2, order) : 0;
      if (!isHighSurrogate(c) || !isLowSurrogate(low)) return at;
      c = joinSurrogates(c, low);
      at += 2;
    }
    end = writeCharacter(c, end);
  }
  out.resize(static_cast<std::size_t>(end - out.data()));
  if (even != units.size()) return even;
  return std::nullopt;
}

}  // namespace appsync::plist
