// Removal of the coordinators that an interrupted sync leaves behind.
#pragma once

#include "device/Device.h"

namespace appsync::daemon {

/// Cancels the coordinators of new apps and updates that a sync created and whose packages will not be sent, and
/// removes their placeholders. Installed versions stay, and the apps are offered again. Coordinators of restores are
/// kept: the store delivers their packages. Coordinators that can complete must have completed before.
void cancelStaleCoordinators(device::Device& device);

}  // namespace appsync::daemon
