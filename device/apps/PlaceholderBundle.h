// The bundle that the home screen shows for an app whose package has not been installed yet.
#pragma once

#include <optional>
#include <string>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/apps/AppTable.h"
#include "device/apps/Containers.h"
#include "device/storage/DeviceFileSystem.h"
#include "platform/InstallTypes.h"
#include "platform/Placeholder.h"

namespace appsync::device {

/// What a placeholder bundle is made of.
struct PlaceholderContents {
  std::string identifier;
  std::string bundleName;  ///< the identifier is shown if this is empty
  platform::TSInstallType installType = platform::TSInstallType::None;
  platform::PlaceholderAttributes attributes;
  std::optional<Bytes> storeMetadata;   ///< a property list, written as it is
  std::optional<std::string> iconPath;  ///< a device path
};

struct PlaceholderContainer {
  PendingContainer container;
  StoredBundle bundle;
};

/// Fills a new container with "Info.plist" and the icon in a folder named after the app, and the store metadata next to
/// that folder. An icon that cannot be read is left out: the home screen then draws one.
[[nodiscard]] Result<PlaceholderContainer> makePlaceholder(DeviceFileSystem& files,
                                                           const PlaceholderContents& contents);

}  // namespace appsync::device
