// The description of an app package, read without unpacking it.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/packages/PackageReader.h"
#include "plist/PropertyList.h"

namespace appsync::device {

/// The description of the app in a package, and the files next to the app.
struct PackageInfo {
  std::string identifier;
  std::optional<std::string> version;
  std::string name;        ///< the display name or, without one, the app folder's
  plist::Dictionary info;  ///< all of "Info.plist"
  std::optional<Bytes> storeMetadata;
  std::optional<Bytes> artwork;
  std::optional<Bytes> icon;       ///< the file that the info dictionary names as the app's icon
  std::uint64_t packageBytes = 0;  ///< of the package file
};

/// Reads the description of a package in a time that hardly depends on the app's size. Checks the list of entries, but
/// not the content of the app's files. Errors are those of `PackageReader`; their text starts with the path.
[[nodiscard]] Result<PackageInfo> readPackageInfo(const std::string& hostPath, PackageLimits limits = {});

}  // namespace appsync::device
