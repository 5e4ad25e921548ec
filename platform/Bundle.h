// Access to app bundles on disk, registered or not.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "platform/FileLocation.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// The main bundle's identifier in the sync daemon's process.
inline constexpr std::string_view kDaemonBundleIdentifier = "com.corvel.zeph";

/// An open bundle: a directory with an "Info.plist". Thread-safe.
class Bundle {
 public:
  virtual ~Bundle() = default;

  [[nodiscard]] virtual const FileLocation& location() const = 0;

  /// Returns the value of `key` in the info dictionary, or null if there is none. Valid as long as the bundle.
  [[nodiscard]] virtual const plist::Value* infoDictionaryValue(std::string_view key) const = 0;
};

/// Thread-safe.
class Bundles {
 public:
  virtual ~Bundles() = default;

  /// Opens the bundle in the directory `location`. Returns null if the directory does not exist or cannot be read. If
  /// the info dictionary is missing or cannot be parsed, the bundle opens with an empty one.
  [[nodiscard]] virtual std::unique_ptr<Bundle> openBundle(const FileLocation& location) = 0;

  /// Returns the bundle identifier of the current process, or nullopt if the process has no bundle.
  [[nodiscard]] virtual std::optional<std::string> mainBundleIdentifier() = 0;
};

}  // namespace appsync::platform
