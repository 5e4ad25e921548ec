#include <string>

#include "tools/Commands.h"
#include "tools/HostState.h"
#include "tools/Leftovers.h"
#include "tools/OpenDevice.h"
#include "tools/PlugIn.h"
#include "tools/StagingArea.h"
#include "tools/StandardOutput.h"

namespace appsync::tools {
namespace {

struct ClearOptions {
  std::string device;
};

constexpr const char* kExamples =
    R"(Removes placeholders, and all that device and host remember of earlier syncs, such as which apps were deleted.
Installed apps stay.

Example:
  appsync clear phone)";

ExitStatus run(const ClearOptions& /*options*/, device::Device& device) {
  const auto client = makeClient(device.platform());
  if (!client) return reportUnusable(client.error());
  giveUpLeftovers(device);
  (*client)->clearSyncData();
  clearStaging(device);
  const Status forgotten = removeHostState(device.path());
  return forgotten ? ExitStatus::done : reportUnusable(forgotten.error());
}

}  // namespace

void addClearCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"clear", "Forget everything about earlier syncs.", kExamples};
  addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
}

}  // namespace appsync::tools
