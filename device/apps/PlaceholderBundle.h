// Placeholder bundles, which the home screen shows for apps that are not installed yet.
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

/// The content of a placeholder bundle.
struct PlaceholderContents {
  std::string identifier;
  std::string bundleName;  ///< if empty, the identifier is shown
  platform::TSInstallType installType = platform::TSInstallType::None;
  platform::PlaceholderAttributes attributes;
  std::optional<Bytes> storeMetadata;   ///< a property list, written unchanged
  std::optional<std::string> iconPath;  ///< a device path
};

struct PlaceholderContainer {
  PendingContainer container;
  StoredBundle bundle;
};

/// Creates a container with "Info.plist" and the icon in an app folder, and the store metadata next to that folder.
/// Omits an icon that cannot be read. The caller commits the container.
[[nodiscard]] Result<PlaceholderContainer> makePlaceholder(DeviceFileSystem& files,
                                                           const PlaceholderContents& contents);

}  // namespace appsync::device
