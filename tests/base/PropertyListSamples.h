// Documents that several tests read.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "base/PropertyList.h"

namespace appsync::test {

/// One of everything that both forms can hold.
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

/// What became of reading a document, for messages of tests: "value" or the error's text.
inline std::string outcome(const Result<plist::Value>& result) {
  return result ? "value" : result.error().text;
}

inline plist::Failure failureOf(const Result<plist::Value>& result) {
  return result ? plist::Failure{0} : static_cast<plist::Failure>(result.error().code);
}

}  // namespace appsync::test
