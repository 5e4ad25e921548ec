// The content of an app's "Info.plist".
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"
#include "plist/PropertyList.h"

namespace appsync::device {

struct BundleInfo {
  std::string identifier;
  std::optional<std::string> version;
  std::optional<std::string> displayName;
  plist::Dictionary dictionary;
};

/// Parses an untrusted "Info.plist" in any property-list format. Fails with an error of platform::kInstallerErrorDomain
/// if it has no valid identifier.
[[nodiscard]] Result<BundleInfo> readBundleInfo(ByteView document);

/// Returns the path of the file that an app's info dictionary names, or nullopt if `name`, which may be null, is not a
/// path inside the app's folder. The file may be missing.
[[nodiscard]] std::optional<std::string> namedFileIn(const std::string& appPath, const plist::Value* name);

/// Returns whether an entry of a package is the app's "Info.plist".
[[nodiscard]] bool isInfoFile(std::string_view path, std::string_view appFolder);

/// Returns the error for a package without an "Info.plist" or, if `appFolder` is empty, without an app.
[[nodiscard]] Error missingInfo(const std::string& appFolder);

/// Returns whether a name has the form "Name.app".
[[nodiscard]] bool isAppFolder(std::string_view folder);

/// Returns the name of an app folder without ".app".
[[nodiscard]] std::string_view appFolderStem(std::string_view folder);

}  // namespace appsync::device
