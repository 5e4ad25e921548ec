#include "daemon/SyncControl.h"

#include <utility>

namespace appsync::daemon {
namespace {

bool isOnItsWay(device::InstallCoordination& coordination, const std::string& identifier) {
  return coordination.coordinatorForApp(platform::CoordinatorKind::any, identifier,
                                        platform::ClientIdentity::CXClientSync, platform::IfMissing::findNothing,
                                        nullptr, nullptr) != nullptr;
}

ControlAnswer carryOut(device::InstallCoordination& coordination, const ControlRequest& request) {
  const std::string& identifier = request.identifier;
  if (!isOnItsWay(coordination, identifier)) {
    return {ControlResult::refused,
            identifier + " is not on its way to the device; `appsync apps` shows which apps wait for their packages"};
  }
  if (request.verb == ControlVerb::prioritize) {
    if (coordination.prioritize(identifier)) return {ControlResult::done, {}};
    return {ControlResult::refused, identifier + " has just come to its end"};
  }
  const Status cancelled = coordination.cancelByUser(identifier);
  if (cancelled) return {ControlResult::done, {}};
  return {ControlResult::refused, identifier + " cannot be cancelled: " + cancelled.error().text};
}

}  // namespace

Result<std::unique_ptr<ControlServer>> openSyncControl(device::Device& device) {
  device::InstallCoordination& coordination = device.services().installCoordination();
  return ControlServer::open(
      device.path(), [&coordination](const ControlRequest& request) { return carryOut(coordination, request); });
}

}  // namespace appsync::daemon
