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
  AppName app;
  std::string type;  ///< "User" or "System"
  bool isInstalled = false;
  bool isPlaceholder = false;
  bool isUnderWay = false;  ///< an install of it has begun and not ended
  platform::TSInstallType installType = platform::TSInstallType::None;
  std::uint64_t bytes = 0;
};

/// Every app and placeholder, in the order in which they came to the device; an error of device::kDeviceDomain when its
/// register cannot be read.
[[nodiscard]] Result<std::vector<DeviceApp>> appsOn(device::Device& device);

}  // namespace appsync::host
