#include "tools/DeviceApps.h"

namespace appsync::tools {

Result<std::vector<DeviceApp>> appsOn(device::Device& device) {
  const auto records = device.services().defaultRegistry().apps();
  if (!records) return device::deviceError(device.path(), device::Access::readOnly, records.error());
  std::vector<DeviceApp> apps;
  apps.reserve(records->size());
  for (const auto& record : *records) {
    apps.push_back({{record->applicationIdentifier(), record->name(), record->bundleVersion().value_or("")},
                    record->applicationType(),
                    record->isInstalled(),
                    record->isPlaceholder(),
                    record->installProgress() != nullptr,
                    record->installType(),
                    record->staticDiskUsage()});
  }
  return apps;
}

}  // namespace appsync::tools
