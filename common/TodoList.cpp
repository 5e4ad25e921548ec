#include "common/TodoList.h"

#include <algorithm>

#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

namespace {

template <class Array>
auto* firstEntryOf(Array& list, std::string_view identifier) {
  const auto found = std::find_if(list.begin(), list.end(), [identifier](const plist::Value& entry) {
    return entryHas(entry, todo::kIdentifier, identifier);
  });
  return found == list.end() ? nullptr : &*found;
}

}  // namespace

const plist::Value* firstEntry(const plist::Array& list, std::string_view identifier) {
  return firstEntryOf(list, identifier);
}

plist::Value* firstEntry(plist::Array& list, std::string_view identifier) {
  return firstEntryOf(list, identifier);
}

TodoIndex::TodoIndex(const std::optional<plist::Array>& list) {
  if (!list) return;
  first_.reserve(list->size());
  for (const plist::Value& entry : *list) {
    if (const auto identifier = stringIn(entry.find(todo::kIdentifier))) first_.emplace(*identifier, &entry);
  }
}

const plist::Value* TodoIndex::firstEntry(std::string_view identifier) const {
  const auto found = first_.find(identifier);
  return found == first_.end() ? nullptr : found->second;
}

}  // namespace appsync
