// The restore state: the paths of restored packages, by app and version, across restarts of the daemon.
#pragma once

#include <string_view>

#include "platform/FileSystem.h"
#include "plist/PropertyList.h"

namespace appsync {

/// The only property: the path of the restored package.
inline constexpr std::string_view kRestoreStatePathKey = "path";

/// The restore-state file: root[identifier][version][key]. Not thread-safe: each change rewrites the whole file. A
/// version may be null and is used only if it is a string.
class RestoreState {
 public:
  /// Reads the file. A file that cannot be parsed has no properties and accepts none.
  explicit RestoreState(platform::FileSystem& files);

  /// Returns null if a level is missing. Valid until the next change.
  [[nodiscard]] const plist::Value* property(std::string_view key, std::string_view identifier,
                                             const plist::Value* version) const;

  /// Sets a property and writes the file. Does nothing if a level is not a dictionary.
  void setProperty(const plist::Value& value, std::string_view key, std::string_view identifier,
                   const plist::Value* version);

  /// Deletes every version of the app; deletes the file if it is empty then or cannot be parsed.
  void erase(std::string_view identifier);

 private:
  platform::FileSystem& files_;
  bool fileExists_ = false;
  plist::Value root_ = plist::Dictionary{};
};

}  // namespace appsync
