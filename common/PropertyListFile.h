// Property lists of which the plug-in knows the form.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/FileSystem.h"
#include "plist/PropertyList.h"

namespace appsync {

/// The dictionary that was read; an error, too, when it is something else.
[[nodiscard]] Result<plist::Dictionary> dictionaryOf(Result<plist::Value> read);

/// The dictionary in that file, in whichever form; null when there is no path, no file or no dictionary in it.
[[nodiscard]] plist::Value readDictionary(platform::FileSystem& files, const std::optional<std::string>& path);

/// Replaces that file, atomically, by the XML form.
[[nodiscard]] Status writePropertyList(platform::FileSystem& files, std::string_view path, const plist::Value& root);

}  // namespace appsync
