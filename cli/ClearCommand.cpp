#include <string>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/StandardOutput.h"
#include "daemon/ClientModule.h"
#include "daemon/CoordinatorCleanup.h"
#include "host/HostState.h"
#include "host/StagingArea.h"

namespace appsync::cli {
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
  const auto client = daemon::makeClient(device.platform());
  if (!client) return reportUnusable(client.error());
  daemon::giveUpLeftovers(device);
  (*client)->clearSyncData();
  host::clearStaging(device);
  const Status forgotten = host::removeHostState(device.path());
  return forgotten ? ExitStatus::done : reportUnusable(forgotten.error());
}

}  // namespace

void addClearCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"clear", "Forget everything about earlier syncs.", kExamples};
  addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
}

}  // namespace appsync::cli
