#include "plist/internal/Encoding.h"

#include <array>

#include "base/UTF8.h"
#include "plist/internal/Failure.h"

namespace appsync::plist {

namespace {

struct Signature {
  std::string_view bytes;
  std::size_t markSize;
  ByteOrder order;
};

using namespace std::string_view_literals;

/// How documents in UTF-16 begin: with a mark, or with a character that takes one byte in ASCII.
constexpr std::array<Signature, 4> kSignatures = {{{"\xFE\xFF"sv, 2, ByteOrder::big},
                                                   {"\xFF\xFE"sv, 2, ByteOrder::little},
                                                   {"\0<"sv, 0, ByteOrder::big},
                                                   {"<\0"sv, 0, ByteOrder::little}}};
constexpr std::string_view kMark = "\xEF\xBB\xBF";

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

std::byte* writeUTF16(std::string_view text, std::byte* out) noexcept {
  for (std::size_t at = 0; at < text.size();) {
    if (const unsigned lead = static_cast<unsigned char>(text[at]); lead < 0x80) {
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

Result<std::string_view> decodeText(ByteView document, std::string& converted) {
  const std::string_view text = textOf(document);
  for (const Signature& signature : kSignatures) {
    if (!text.starts_with(signature.bytes)) continue;
    converted.reserve(text.size() / 2);
    const auto bad = appendUTF16(converted, document.subspan(signature.markSize), signature.order);
    if (bad) return failureAt(Failure::badText, "A lone surrogate or half a character", signature.markSize + *bad);
    return std::string_view(converted);
  }
  const std::size_t markSize = text.starts_with(kMark) ? kMark.size() : 0;
  if (const auto bad = findMalformedUTF8(text)) return failureAt(Failure::badText, "A byte that is not UTF-8", *bad);
  return text.substr(markSize);
}

}  // namespace appsync::plist
