#include <memory>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "device/Device.h"

namespace appsync::cli {
namespace {

struct InitOptions {
  std::string device;
  bool isCoordinated = false;
  bool isDirect = false;
};

constexpr const char* kExamples =
    R"(A device is a folder: DEVICE/root is its file system, the rest is its registry and settings. The folder must be
missing or empty.

A coordinated device installs apps through coordinators: while a sync runs, `appsync tap` sends an app before the
others, and `appsync cancel` skips one. On a direct device the sync installs each package itself. Both end with the
same apps; `appsync set DEVICE coordination=on` or `=off` changes a device later.

Examples:
  appsync init phone
  appsync init old-phone --direct)";

ExitStatus run(const InitOptions& options) {
  const auto device = device::Device::create(
      options.device, options.isDirect ? device::InstallMode::direct : device::InstallMode::coordinated);
  if (!device) return reportUnusable(device.error());
  StandardOutput output;
  output.writeLine("Created the device " + printable(options.device) + ".");
  return output.finish(ExitStatus::done);
}

}  // namespace

void addInitCommand(CLI::App& line, Invocation& invocation) {
  const auto options = std::make_shared<InitOptions>();
  CLI::App* command = line.add_subcommand("init", "Create an empty device.");
  command->add_option("DEVICE", options->device, "the folder to create the device in")->required();
  CLI::Option* coordinated =
      command->add_flag("--coordinated", options->isCoordinated, "install through coordinators (default)");
  command->add_flag("--direct", options->isDirect, "install packages in the sync itself")->excludes(coordinated);
  command->footer(kExamples);
  command->callback([options, &invocation] { invocation = [options] { return run(*options); }; });
}

}  // namespace appsync::cli
