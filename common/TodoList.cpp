#include "common/TodoList.h"

#include <algorithm>
#include <utility>

#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync::todo {

namespace {

auto hasIdentifier(std::string_view identifier) {
  return [identifier](const plist::Value& entry) { return plist::entryHas(entry, kIdentifier, identifier); };
}

}  // namespace

std::optional<plist::Array> load(platform::FileSystem& files, std::string_view path, const PlugInLog& log,
                                 ErrorSlot error) {
  const auto bytes = files.readFile(path);
  if (!bytes) {
    setError(error, bytes.error());
    return std::nullopt;
  }
  if (bytes->empty()) return std::nullopt;

  auto list = plist::readBinaryOrXML(*bytes);
  if (!list) {
    setError(error, list.error());
    log.error("%s|couldn't parse todo list");
    return std::nullopt;
  }
  plist::Array* entries = list->array();
  if (entries == nullptr) {
    log.error("%s|todo list is not an array");
    return std::nullopt;
  }
  return std::move(*entries);
}

const plist::Value* find(const plist::Array& list, std::string_view identifier) {
  const auto found = std::find_if(list.begin(), list.end(), hasIdentifier(identifier));
  return found == list.end() ? nullptr : &*found;
}

bool setOperation(plist::Array& list, std::string_view identifier, std::string_view operation, const PlugInLog& log) {
  const auto entry = std::find_if(list.begin(), list.end(), hasIdentifier(identifier));
  if (entry == list.end()) return false;
  log.message("%s|Changing %{public}@ from %{public}@ to %{public}@", identifier,
              std::as_const(*entry).find(kOperation), operation);
  entry->dictionary()->set(kOperation, operation);
  return true;
}

Status save(platform::FileSystem& files, std::string_view path, plist::Array list) {
  const auto bytes = plist::writeBinary(std::move(list));
  return bytes ? files.writeFileAtomically(path, *bytes) : Status(bytes.error());
}

Index::Index(const std::optional<plist::Array>& list) {
  if (!list) return;
  first_.reserve(list->size());
  for (const plist::Value& entry : *list) {
    if (const auto identifier = stringIn(entry.find(kIdentifier))) first_.emplace(*identifier, &entry);
  }
}

const plist::Value* Index::find(std::string_view identifier) const {
  const auto found = first_.find(identifier);
  return found == first_.end() ? nullptr : found->second;
}

}  // namespace appsync::todo
