#include <vector>

#include "tools/Commands.h"
#include "tools/OpenDevice.h"
#include "tools/StandardOutput.h"

namespace appsync::tools {
namespace {

struct SetOptions {
  std::string device;
  std::vector<std::string> assignments;
};

constexpr const char* kExamples = R"(Keys and their values:
  app-installation   yes, no or unset: whether apps may be installed
  app-removal        yes, no or unset: whether apps may be removed
  coordination       on, off or unset: whether apps are installed through coordinators, which can be tapped and
                     cancelled while a sync runs; from the next sync on
  assertion          ID:granted, ID:denied, ID:unknown, ID:failing or ID:unset: what the home screen
                     answers when app ID is about to be replaced

Examples:
  appsync set phone app-removal=no
  appsync set phone app-removal=unset app-installation=unset
  appsync set phone coordination=off)";

ExitStatus run(const SetOptions& options, device::Device& device) {
  for (const std::string& assignment : options.assignments) {
    const Status set = device.services().settings().assign(assignment);
    if (set) continue;
    if (set.error().domain != device::kSettingsDomain) return reportUnusable(set.error());
    printError(set.error().text);
    return ExitStatus::wrongUsage;
  }
  return ExitStatus::done;
}

}  // namespace

void addSetCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"set", "Change a device's settings.", kExamples};
  const auto added = addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
  added.command.add_option("KEY=VALUE", added.options->assignments, "what to set")->required();
}

}  // namespace appsync::tools
