// The apps of a device, as values.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "device/Device.h"
#include "host/AppOutcome.h"
#include "platform/InstallTypes.h"

namespace appsync::host {

struct DeviceApp {
  AppName name;
  std::string type;  ///< "User" or "System"
  bool isInstalled = false;
  bool isPlaceholder = false;
  bool isUnderWay = false;  ///< an install of it has started and not ended
  platform::TSInstallType installType = platform::TSInstallType::None;
  std::uint64_t bytes = 0;
};

/// Returns every app and placeholder, in the order of installation. Fails with an error of device::kDeviceDomain if the
/// device's registry cannot be read.
[[nodiscard]] Result<std::vector<DeviceApp>> appsOn(device::Device& device);

}  // namespace appsync::host
