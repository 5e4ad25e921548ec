// Documents that several tests read.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync::test {

/// One value of each kind that both formats can represent.
inline plist::Value sampleValue() {
  using plist::Array;
  using plist::Dictionary;
  const auto entry = [](int number) {
    return Dictionary{{"identifier", "com.example.app" + std::to_string(number)}, {"name", "Café ☕"}, {"size", number}};
  };
  return Dictionary{
      {"array", Array{true, false, 0, -1, 255, 256, 65536, INT64_MIN, INT64_MAX, UINT64_MAX, 1.5, -0.25}},
      {"date", plist::Date{631152000}},
      {"data", Bytes(70, std::byte{0x5A})},
      {"empty", Array{Array{}, Dictionary{}, "", plist::Value::data({})}},
      {"entries", Array{entry(1), entry(2), entry(3)}},
      {"a key that does not fit into thirty bytes", "a text that does not fit into thirty bytes"},
      {"non-ASCII 😀", "<&> 'quoted' \"text\"\n\tüber ﬁ 旅行"},
  };
}

inline std::string_view textOf(const Result<Bytes>& document) {
  return appsync::textOf(document.value());
}

/// A binary document: objects, their offsets, and a trailer with sizes of one byte. The root is the first object.
inline std::string binaryDocument(const std::vector<std::string>& objects) {
  std::string document = "bplist00";
  std::string offsets;
  for (const std::string& object : objects) {
    offsets += static_cast<char>(document.size());
    document += object;
  }
  const auto table = document.size();
  document += offsets;
  document += std::string(6, '\0') + "\x01\x01";
  for (const std::size_t number : {objects.size(), std::size_t{0}, table}) {
    document += std::string(7, '\0') + static_cast<char>(number);
  }
  return document;
}

/// Ends a document that is longer than `binaryDocument` makes: the root is object 0, references are one byte.
inline std::string withTable(std::string document, const std::vector<std::size_t>& offsets) {
  const std::size_t table = document.size();
  for (const std::size_t offset : offsets)
    document += {static_cast<char>(offset >> 8), static_cast<char>(offset)};
  document += std::string(6, '\0') + "\x02\x01";
  for (const std::size_t number : {offsets.size(), std::size_t{0}, table})
    document += std::string(6, '\0') + static_cast<char>(number >> 8) + static_cast<char>(number);
  return document;
}

/// A document of many long objects, the content of each of which begins with the objects after it, or is that of all.
enum class OverlappingObjects { arrays, texts, same };
inline std::string overlappingDocument(OverlappingObjects what) {
  constexpr std::size_t kFirst = 100;
  constexpr std::size_t kEnd = 164;
  // Taken for references, its bytes are those of other objects than these.
  const std::string header = what == OverlappingObjects::texts ? "\x5F\x11\x60\x60" : "\xAF\x11\x60\x60";
  std::string document = "bplist00\xAF\x10" + std::string(1, static_cast<char>(kEnd - kFirst));
  for (std::size_t number = kFirst; number < kEnd; ++number)
    document += static_cast<char>(number);
  std::vector<std::size_t> offsets(256, document.size());
  offsets[0] = std::string_view("bplist00").size();
  document += '\x09';
  for (std::size_t number = kFirst; number < kEnd; ++number) {
    offsets[number] = document.size();
    document += header;
  }
  if (what == OverlappingObjects::same) std::fill(&offsets[kFirst], &offsets[kEnd], offsets[kEnd - 1]);
  document += std::string(0x6060, '\x01');
  return withTable(std::move(document), offsets);
}

/// Returns "value" or the text of the error, for test messages.
inline std::string outcome(const Result<plist::Value>& result) {
  return result ? "value" : result.error().text;
}

inline plist::Failure failureOf(const Result<plist::Value>& result) {
  return result ? plist::Failure{0} : static_cast<plist::Failure>(result.error().code);
}

}  // namespace appsync::test
