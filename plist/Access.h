// Access to property lists from untrusted input: every type may be wrong, and nothing fails.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync::plist {

// Values passed by pointer may be null.

/// Returns the value under `key`, or null if `value` is not a dictionary or has no such key.
[[nodiscard]] inline const Value* find(const Value* value, std::string_view key) noexcept {
  return value == nullptr ? nullptr : value->find(key);
}

/// Returns the text of a string, or nullopt for any other type. Valid as long as `value`.
[[nodiscard]] inline std::optional<std::string_view> stringIn(const Value* value) noexcept {
  return value == nullptr ? std::nullopt : value->string();
}

/// Returns a copy of the text of a string, or nullopt for any other type.
[[nodiscard]] inline std::optional<std::string> ownedStringIn(const Value* value) {
  const auto text = stringIn(value);
  return text ? std::optional<std::string>(*text) : std::nullopt;
}

/// Returns the bytes of data, or nullopt for any other type. Valid as long as `value`.
[[nodiscard]] inline std::optional<ByteView> dataIn(const Value* value) noexcept {
  return value == nullptr ? std::nullopt : value->data();
}

/// Returns the boolean that `value` converts to (see truth), or false if it does not convert.
[[nodiscard]] inline bool booleanIn(const Value* value) noexcept {
  return value != nullptr && truth(*value).value_or(false);
}

/// Whether `entry` is a dictionary whose `key` holds exactly the string `text`.
[[nodiscard]] inline bool entryHas(const Value& entry, std::string_view key, std::string_view text) noexcept {
  return stringIn(entry.find(key)) == text;
}

/// Returns copies of all keys, in their order.
[[nodiscard]] inline std::vector<std::string> keysOf(const Dictionary& dictionary) {
  std::vector<std::string> keys;
  keys.reserve(dictionary.size());
  for (const auto& [key, value] : dictionary)
    keys.emplace_back(key);
  return keys;
}

}  // namespace appsync::plist
