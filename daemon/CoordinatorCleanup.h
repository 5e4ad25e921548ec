// What syncs leave behind that did not come to their end.
#pragma once

#include "device/Device.h"

namespace appsync::daemon {

/// Gives up the coordinators of new apps and updates that a sync made and nobody will bring packages for, with their
/// placeholders; of each such app what is installed stays, and it is offered again. Those that have all they need are
/// to be waited for before. Restores stay: the store brings their packages.
void giveUpLeftovers(device::Device& device);

}  // namespace appsync::daemon
