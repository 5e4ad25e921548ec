// What an install was asked to do.
#pragma once

#include <optional>
#include <string>

#include "base/Bytes.h"
#include "base/Error.h"
#include "base/PropertyList.h"
#include "device/AppTable.h"

namespace appsync::device {

/// The install options, each checked.
struct InstallRequest {
  BundleRole role = BundleRole::installed;
  std::string identifier;
  std::optional<platform::TSInstallType> installType;
  std::optional<Bytes> storeMetadata;
  std::optional<Bytes> licenceData;
};

/// Keys that installing does not know are passed over. Errors: platform::InstallerErrorDomain.
[[nodiscard]] Result<InstallRequest> readInstallOptions(const plist::Dictionary& options);

}  // namespace appsync::device
