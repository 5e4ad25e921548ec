// Property-list files of the plug-in.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/FileSystem.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Returns the dictionary that was read, or an error, also if the root is not a dictionary.
[[nodiscard]] Result<plist::Dictionary> dictionaryOf(Result<plist::Value> read);

/// Returns the dictionary in that file, in any format, or null if there is no path, no file or no dictionary.
[[nodiscard]] plist::Value readDictionary(platform::FileSystem& files, const std::optional<std::string>& path);

/// Replaces that file, atomically, by `root` in the XML format.
[[nodiscard]] Status writePropertyList(platform::FileSystem& files, std::string_view path, const plist::Value& root);

}  // namespace appsync
