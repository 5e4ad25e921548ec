#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "device/screen/ScreenPicture.h"
#include "device/storage/HostFile.h"

namespace appsync::cli {
namespace {

struct ScreenOptions {
  std::string device;
  std::string picture;
};

constexpr const char* kExamples = R"(Apps that wait for their packages are drawn with their progress.

Example:
  appsync screen phone -o screen.png)";

ExitStatus run(const ScreenOptions& options, device::Device& device) {
  if (isForTerminal(options.picture, "a picture")) return ExitStatus::wrongUsage;
  device::Services& services = device.services();
  const Status drawn = device::drawScreen(
      {services.homeScreen(), services.defaultRegistry(), services.bundles(), services.iconRenderer()},
      options.picture);
  if (!drawn) return reportUnusable(drawn.error());
  if (options.picture == device::kStandardStream) return ExitStatus::done;
  StandardOutput output;
  output.writeLine("Drew the home screen as " + printable(options.picture) + ".");
  return output.finish(ExitStatus::done);
}

}  // namespace

void addScreenCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"screen", "Draw the device's home screen.", kExamples};
  const auto added = addDeviceCommand(line, invocation, text, device::Access::readOnly, run);
  added.command.add_option("-o,--output", added.options->picture, "the PNG file to write; - is standard output")
      ->required();
}

}  // namespace appsync::cli
