#include "plist/internal/Encoding.h"

#include <array>

#include "plist/internal/Failure.h"
#include "plist/internal/Text.h"

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

}  // namespace

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
