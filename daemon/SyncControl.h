// What other processes may ask of a running sync.
#pragma once

#include <memory>

#include "base/Error.h"
#include "daemon/control/Server.h"
#include "device/Device.h"

namespace appsync::daemon {

/// Carries out what other processes ask as if the device's person had asked for it, for as long as the result lives.
/// Fails if the socket cannot be made.
[[nodiscard]] Result<std::unique_ptr<ControlServer>> openSyncControl(device::Device& device);

}  // namespace appsync::daemon
