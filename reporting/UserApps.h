// The apps that reports cover, and their store metadata: a file next to the app's bundle.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "platform/AppRegistry.h"
#include "platform/FileSystem.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Larger files are ignored: no store writes one, and a file must not exhaust the daemon's memory.
inline constexpr std::uint64_t kMaximumStoreMetadataBytes = std::uint64_t{16} << 20;

/// Calls `visit` with the record of each app among the user bundles, in the registry's order.
template <class Visit>
void visitUserApps(platform::AppRegistry& registry, const Visit& visit) {
  registry.enumerateBundlesOfType(platform::BundleKind::user, [&visit](const platform::BundleRecord& bundle, bool&) {
    if (const platform::AppRecord* app = bundle.asAppRecord()) visit(*app);
  });
}

/// Returns the device path of the app's file, which may not exist, or nullopt for an app without a container.
[[nodiscard]] std::optional<std::string> storeMetadataPath(const platform::AppRecord& app);

/// Returns the dictionary in that file, or null if there is none.
[[nodiscard]] plist::Value readStoreMetadata(platform::FileSystem& files, const std::optional<std::string>& path);

}  // namespace appsync
