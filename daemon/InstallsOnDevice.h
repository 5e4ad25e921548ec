// What the device's registry says of an app that was sent.
#pragma once

#include <string>

#include "daemon/PendingInstalls.h"
#include "device/Device.h"
#include "host/SyncProgress.h"

namespace appsync::daemon {

/// Installs that run side by side; those behind them wait for their turn and have nothing to show.
inline constexpr std::size_t kShownInstalls = 10;

/// Tells the progress how far an app's install is, if one runs, and returns that fraction, else 0.
double showInstall(device::Device& device, const std::string& identifier, host::SyncProgress& progress);

/// What came of an app that was sent, as the device knows it.
[[nodiscard]] host::AppOutcome outcomeOnDevice(device::Device& device, const SentPackage& package);

}  // namespace appsync::daemon
