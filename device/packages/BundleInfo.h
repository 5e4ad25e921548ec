// What an app's "Info.plist" says.
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

/// Reads an "Info.plist" in any of its forms. The identifier is there and well formed, or it is an error of
/// platform::kInstallerErrorDomain.
[[nodiscard]] Result<BundleInfo> readBundleInfo(ByteView document);

/// Where the file is that an app names in its info dictionary: none when `name`, which may be null, is none of a file
/// inside the app's folder. Whether it is there is another question.
[[nodiscard]] std::optional<std::string> namedFileIn(const std::string& appPath, const plist::Value* name);

/// Whether an entry of a package is the app's "Info.plist".
[[nodiscard]] bool isInfoFile(std::string_view path, std::string_view appFolder);

/// The error of a package without one; `appFolder` may be empty: then it has no app at all.
[[nodiscard]] Error missingInfo(const std::string& appFolder);

/// "Name.app", whatever the name.
[[nodiscard]] bool isAppFolder(std::string_view folder);

/// The name of an app folder without ".app".
[[nodiscard]] std::string_view appFolderStem(std::string_view folder);

}  // namespace appsync::device
