// Bundle identifiers: sets of them, and the check of those that a host gives.
#pragma once

#include <functional>
#include <set>
#include <string>
#include <string_view>

#include "plist/Value.h"

namespace appsync {

using IdentifierSet = std::set<std::string, std::less<>>;

/// Returns the keys of a map whose keys are bundle identifiers.
template <class Map>
[[nodiscard]] IdentifierSet identifiersOf(const Map& map) {
  IdentifierSet identifiers;
  for (const auto& [identifier, value] : map)
    identifiers.insert(identifiers.end(), identifier);
  return identifiers;
}

/// Whether `value`, which may be null, is a string without "/..". Required of every identifier and path from the host;
/// a device may accept fewer characters in the identifiers of its apps.
[[nodiscard]] bool isValidBundleIdentifier(const plist::Value* value);
[[nodiscard]] bool isValidBundleIdentifier(std::string_view text);

}  // namespace appsync
