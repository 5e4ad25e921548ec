// What the store said of an installed app: a file beside the app's bundle.
#pragma once

#include <optional>
#include <string>

#include "platform/AppRecord.h"
#include "platform/FileSystem.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Device path of the app's file, which may be missing; none for an app without a container.
[[nodiscard]] std::optional<std::string> storeMetadataPath(const platform::AppRecord& app);

/// The dictionary in that file, read once and whole; null when there is no such file or nothing of the kind in it.
[[nodiscard]] plist::Value readStoreMetadata(platform::FileSystem& files, const std::optional<std::string>& path);

}  // namespace appsync
