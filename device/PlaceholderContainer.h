// The bundle that stands on the home screen for an app whose package is still to come.
#pragma once

#include "base/Error.h"
#include "device/AppTable.h"
#include "device/Containers.h"
#include "device/CoordinatorState.h"
#include "device/DeviceFileSystem.h"

namespace appsync::device {

struct PlaceholderContainer {
  NewContainer container;
  StoredBundle bundle;
};

/// Fills a new container with "Info.plist" and the icon in a folder named after the app, and the store metadata beside
/// it. An icon that is not there yet, or cannot be read, is left out: the home screen then draws one.
[[nodiscard]] Result<PlaceholderContainer> makePlaceholder(DeviceFileSystem& files,
                                                           const PlaceholderState& placeholder);

}  // namespace appsync::device
