#include <memory>

#include "device/Device.h"
#include "tools/Commands.h"
#include "tools/OpenDevice.h"
#include "tools/Printable.h"
#include "tools/StandardOutput.h"

namespace appsync::tools {
namespace {

struct InitOptions {
  std::string device;
  bool direct = false;
};

constexpr const char* kExamples =
    R"(A device is a folder: DEVICE/root is its file system, the rest is its registry and settings. The folder must be
missing or empty.

Example:
  appsync init phone)";

ExitStatus run(const InitOptions& options) {
  const auto device = device::Device::create(options.device);
  if (!device) return reportUnusable(device.error());
  StandardOutput output;
  output.writeLine("Made the device " + printable(options.device) + ".");
  return output.finish(ExitStatus::done);
}

}  // namespace

void addInitCommand(CLI::App& line, Invocation& invocation) {
  const auto options = std::make_shared<InitOptions>();
  CLI::App* command = line.add_subcommand("init", "Make a new, empty device.");
  command->add_option("DEVICE", options->device, "the folder that becomes the device")->required();
  command->add_flag("--direct", options->direct, "let the sync install packages itself; this is what happens anyway");
  command->footer(kExamples);
  command->callback([options, &invocation] { invocation = [options] { return run(*options); }; });
}

}  // namespace appsync::tools
