#include "tools/DeviceApps.h"

#include "device/AppRecord.h"

namespace appsync::tools {

std::vector<DeviceApp> appsOn(device::Device& device) {
  std::vector<DeviceApp> apps;
  const auto add = [&](const platform::BundleRecord& bundle, bool& /*stop*/) {
    const auto* record = dynamic_cast<const device::AppRecord*>(bundle.asAppRecord());
    if (record == nullptr) return;
    apps.push_back({{record->applicationIdentifier(), record->name(), record->bundleVersion().value_or("")},
                    record->applicationType(),
                    record->isInstalled(),
                    record->isPlaceholder(),
                    record->installProgress() != nullptr,
                    record->installType(),
                    record->staticDiskUsage()});
  };
  device.platform().defaultRegistry().enumerateBundlesOfType(platform::BundleKind::All, add);
  return apps;
}

}  // namespace appsync::tools
