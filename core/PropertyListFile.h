// Property lists that other components wrote.
#pragma once

#include <optional>
#include <string>

#include "base/PropertyList.h"
#include "platform/FileSystem.h"

namespace appsync {

/// The dictionary in that file, in whichever form; null when there is no path, no file or no dictionary in it.
[[nodiscard]] plist::Value readDictionary(platform::FileSystem& files, const std::optional<std::string>& path);

}  // namespace appsync
