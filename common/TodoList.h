// Looking things up in the host's todo list.
#pragma once

#include <optional>
#include <string_view>
#include <unordered_map>

#include "base/SeededHash.h"
#include "plist/PropertyList.h"

namespace appsync {

/// The first entry whose "identifier" is `identifier`, or null; later ones are never seen.
[[nodiscard]] const plist::Value* firstEntry(const plist::Array& list, std::string_view identifier);
[[nodiscard]] plist::Value* firstEntry(plist::Array& list, std::string_view identifier);

/// The same answers for many identifiers, after one walk of the list. Refers to the list, which must stay as it is.
class TodoIndex {
 public:
  /// An absent list has no entries.
  explicit TodoIndex(const std::optional<plist::Array>& list);
  explicit TodoIndex(std::optional<plist::Array>&&) = delete;

  [[nodiscard]] const plist::Value* firstEntry(std::string_view identifier) const;

 private:
  std::unordered_map<std::string_view, const plist::Value*, SeededHash> first_;
};

}  // namespace appsync
