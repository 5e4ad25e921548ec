#include "cli/DeviceCommand.h"

#include "cli/StandardOutput.h"

namespace appsync::cli {

void addDevice(CLI::App& command, std::string& path) {
  command.add_option("DEVICE", path, "the device's folder, created by `appsync init`")->required();
}

ExitStatus withDevice(const std::string& path, device::Access access,
                      const std::function<ExitStatus(device::Device&)>& work) {
  const auto device = device::Device::open(path, access);
  return device ? work(**device) : reportUnusable(device.error());
}

}  // namespace appsync::cli
