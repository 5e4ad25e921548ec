#include <memory>

#include "device/ScreenPicture.h"
#include "tools/Commands.h"
#include "tools/OpenDevice.h"
#include "tools/Printable.h"
#include "tools/StandardOutput.h"

namespace appsync::tools {
namespace {

struct ScreenOptions {
  std::string device;
  std::string picture;
};

constexpr const char* kExamples = R"(Apps whose packages are still to come are shown with how far they are.

Example:
  appsync screen phone -o screen.png)";

ExitStatus run(const ScreenOptions& options, device::Device& device) {
  device::Services& services = device.services();
  const Status drawn = device::drawScreen(
      {services.homeScreen(), services.defaultRegistry(), services.bundles(), services.iconRenderer()},
      options.picture);
  if (!drawn) return reportUnusable(drawn.error());
  StandardOutput output;
  output.writeLine("Drew the home screen as " + printable(options.picture) + ".");
  return output.finish(ExitStatus::done);
}

}  // namespace

void addScreenCommand(CLI::App& line, Invocation& invocation) {
  const auto options = std::make_shared<ScreenOptions>();
  CLI::App* command = line.add_subcommand("screen", "Draw the device's home screen.");
  addDevice(*command, options->device);
  command->add_option("-o,--output", options->picture, "the PNG file to write")->required();
  command->footer(kExamples);
  command->callback([options, &invocation] {
    invocation = [options] {
      return withDevice(options->device, device::Access::readOnly,
                        [&](device::Device& device) { return run(*options, device); });
    };
  });
}

}  // namespace appsync::tools
