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
    R"(Removes placeholders and the state that device and host keep of earlier syncs, such as the list of deleted apps.
Installed apps stay.

Example:
  appsync clear phone)";

ExitStatus run(const ClearOptions& /*options*/, device::Device& device) {
  const auto client = daemon::makeClient(device.platform());
  if (!client) return reportUnusable(client.error());
  daemon::cancelStaleCoordinators(device);
  (*client)->clearSyncData();
  host::clearStaging(device);
  const Status removed = host::removeHostState(device.path());
  return removed ? ExitStatus::done : reportUnusable(removed.error());
}

}  // namespace

void addClearCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"clear", "Remove the state of earlier syncs.", kExamples};
  addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
}

}  // namespace appsync::cli
