// What the store said of an installed app: a file beside the app's bundle.
#pragma once

#include <optional>
#include <string>

#include "platform/AppRecord.h"

namespace appsync {

/// Device path of the app's file, which may be missing; none for an app without a container.
[[nodiscard]] std::optional<std::string> storeMetadataPath(const platform::AppRecord& app);

}  // namespace appsync
