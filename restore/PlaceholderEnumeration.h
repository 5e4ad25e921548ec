// The bundles that count as an app's placeholder.
#pragma once

#include <string_view>

#include "common/Identifiers.h"
#include "common/PlugInLog.h"
#include "platform/AppRegistry.h"

namespace appsync {

/// Logged if an app that is to be restored already has a placeholder.
inline constexpr PlugInLog::Format<std::string_view> kFoundPlaceholder = "%s|Found placeholder for bundle %{public}@";

/// Returns the identifiers of all installed apps and placeholders of users.
[[nodiscard]] IdentifierSet userBundles(platform::AppRegistry& registry);

}  // namespace appsync
