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

/// What a package says of its app, and what stands beside the app in it.
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

/// Looks at a package without unpacking it, so that it takes about the same time however large the app is. The whole
/// list of entries is checked; bytes of the app's files are not. Errors: as `PackageReader`; the text starts with the
/// path.
[[nodiscard]] Result<PackageInfo> readPackageInfo(const std::string& hostPath, PackageLimits limits = {});

}  // namespace appsync::device
