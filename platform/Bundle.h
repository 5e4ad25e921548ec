// App bundles as folders, whether the registry knows them or not.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "platform/FileLocation.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// An opened bundle: a folder with an "Info.plist". Threads: any.
class Bundle {
 public:
  virtual ~Bundle() = default;

  [[nodiscard]] virtual const FileLocation& location() const = 0;

  /// A value of the bundle's info dictionary; null when there is none under that key. Lives as long as the bundle.
  [[nodiscard]] virtual const plist::Value* infoDictionaryValue(std::string_view key) const = 0;
};

/// Threads: any.
class Bundles {
 public:
  virtual ~Bundles() = default;

  /// The bundle in that folder; null when there is no such folder or it cannot be read. A folder whose info dictionary
  /// is missing or unusable opens as a bundle without info.
  [[nodiscard]] virtual std::unique_ptr<Bundle> openBundle(const FileLocation& location) = 0;

  /// The bundle identifier of the process that this code runs in; absent when the process has no bundle.
  [[nodiscard]] virtual std::optional<std::string> mainBundleIdentifier() = 0;
};

}  // namespace appsync::platform
