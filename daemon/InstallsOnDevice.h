// The state of installs in the device's registry.
#pragma once

#include <string>

#include "daemon/PendingInstalls.h"
#include "device/Device.h"
#include "host/SyncProgress.h"

namespace appsync::daemon {

/// Number of installs that run at the same time. Later ones are queued and have no progress.
inline constexpr std::size_t kShownInstalls = 10;

/// Reports the progress of an app's install and returns its fraction, or 0 if no install is running.
double showInstall(device::Device& device, const std::string& identifier, host::SyncProgress& progress);

/// Returns the outcome of an install that has ended.
[[nodiscard]] host::AppOutcome outcomeOnDevice(device::Device& device, const PendingInstall& package);

}  // namespace appsync::daemon
