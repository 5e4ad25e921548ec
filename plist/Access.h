// Small questions to property lists that come from outside: every type may be wrong, and nothing fails.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync {

/// The bytes of data that `value`, which may be null, holds; none for any other type.
[[nodiscard]] inline std::optional<ByteView> dataIn(const plist::Value* value) {
  return value == nullptr ? std::nullopt : value->data();
}

/// False for what is absent or cannot give a boolean.
[[nodiscard]] inline bool booleanIn(const plist::Value* value) {
  return value != nullptr && plist::truth(*value).value_or(false);
}

/// Whether `entry` is a dictionary whose `key` holds exactly the string `text`.
[[nodiscard]] inline bool entryHas(const plist::Value& entry, std::string_view key, std::string_view text) {
  return stringIn(entry.find(key)) == text;
}

[[nodiscard]] inline std::vector<std::string> keysOf(const plist::Dictionary& dictionary) {
  std::vector<std::string> keys;
  keys.reserve(dictionary.size());
  for (const auto& [key, value] : dictionary)
    keys.emplace_back(key);
  return keys;
}

}  // namespace appsync
