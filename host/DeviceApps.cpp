#include "host/DeviceApps.h"

namespace appsync::host {

Result<std::vector<DeviceApp>> appsOn(device::Device& device) {
  const auto records = device.services().defaultRegistry().apps();
  if (!records) return device::deviceError(device.path(), device::Access::readOnly, records.error());
  std::vector<DeviceApp> apps;
  apps.reserve(records->size());
  for (const auto& record : *records) {
    DeviceApp& app = apps.emplace_back();
    app.name = {record->applicationIdentifier(), record->name(), record->bundleVersion().value_or("")};
    app.type = record->applicationType();
    app.isInstalled = record->isInstalled();
    app.isPlaceholder = record->isPlaceholder();
    app.isUnderWay = record->installProgress() != nullptr;
    app.installType = record->installType();
    app.bytes = record->staticDiskUsage();
  }
  return apps;
}

}  // namespace appsync::host
