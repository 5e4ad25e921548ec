// The form of the restore state store.
#pragma once

#include <string_view>

#include "plist/PropertyList.h"

namespace appsync {

/// The one property that is kept: where the restored package lies.
inline constexpr std::string_view kRestoreStatePathKey = "path";

/// What stands at root[identifier][version][key], or null. `version` may be null; only a string names one.
[[nodiscard]] const plist::Value* restoreStateProperty(const plist::Value& root, std::string_view key,
                                                       std::string_view identifier, const plist::Value* version);

}  // namespace appsync
