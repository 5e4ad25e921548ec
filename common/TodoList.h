// The host's todo list: an array of dictionaries, see `todo::kIdentifier` and the keys next to it.
#pragma once

#include <optional>
#include <string_view>
#include <unordered_map>

#include "base/Error.h"
#include "base/SeededHash.h"
#include "common/PlugInLog.h"
#include "platform/FileSystem.h"
#include "plist/PropertyList.h"

namespace appsync::todo {

/// Returns the array in the file at `path`, in the binary or the XML format, or nullopt. Logs a file that is neither
/// missing nor empty and holds no array; sets `error` if the file cannot be read or parsed.
[[nodiscard]] std::optional<plist::Array> load(platform::FileSystem& files, std::string_view path, const PlugInLog& log,
                                               ErrorSlot error);

/// Returns the first entry whose "identifier" is `identifier`, or null; later entries are ignored.
[[nodiscard]] const plist::Value* find(const plist::Array& list, std::string_view identifier);

/// Sets the "operation" of that entry and logs the change. Returns false if there is no entry.
[[nodiscard]] bool setOperation(plist::Array& list, std::string_view identifier, std::string_view operation,
                                const PlugInLog& log);

/// Replaces the file at `path`, atomically, by the list in the binary format.
Status save(platform::FileSystem& files, std::string_view path, plist::Array list);

/// `find` for many identifiers, after one pass over the list. Refers to the list, which must not change.
class Index {
 public:
  /// nullopt has no entries.
  explicit Index(const std::optional<plist::Array>& list);
  explicit Index(std::optional<plist::Array>&&) = delete;

  [[nodiscard]] const plist::Value* find(std::string_view identifier) const;

 private:
  std::unordered_map<std::string_view, const plist::Value*, SeededHash> first_;
};

}  // namespace appsync::todo
