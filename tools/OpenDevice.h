// Devices for commands.
#pragma once

#include <functional>
#include <string>

#include <CLI/CLI.hpp>

#include "device/Device.h"
#include "tools/ExitStatus.h"

namespace appsync::tools {

/// Adds the positional DEVICE to a command.
void addDevice(CLI::App& command, std::string& path);

/// Opens the device and does `work` with it; a device that cannot be opened is reported.
[[nodiscard]] ExitStatus withDevice(const std::string& path, device::Access access,
                                    const std::function<ExitStatus(device::Device&)>& work);

}  // namespace appsync::tools
