// What other processes may ask of a running sync.
#pragma once

#include <memory>

#include "device/Device.h"
#include "tools/ControlServer.h"

namespace appsync::tools {

/// Carries out what other processes ask as if the device's person had asked for it, for as long as the result lives.
/// Null, after a word on standard error, when the socket cannot be made: a sync does without.
[[nodiscard]] std::unique_ptr<ControlServer> openSyncControl(device::Device& device);

}  // namespace appsync::tools
