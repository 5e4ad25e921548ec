#include "daemon/CoordinatorCleanup.h"

#include "platform/SyncFramework.h"

namespace appsync::daemon {
namespace {

using platform::ClientIdentity;
using platform::CoordinatorKind;

bool isStale(const device::CoordinatorSummary& coordinator) {
  return coordinator.creator == ClientIdentity::CXClientSync &&
         (coordinator.kind == CoordinatorKind::initiating || coordinator.kind == CoordinatorKind::updating);
}

}  // namespace

void cancelStaleCoordinators(device::Device& device) {
  device::InstallCoordination& coordination = device.services().installCoordination();
  const auto coordinators = coordination.list();
  if (!coordinators) return;
  const Error reason = {std::string(platform::kZTErrorDomain), static_cast<long>(device::TransferFailure::interrupted),
                        "the sync ended before the package was sent; the next sync offers it again", nullptr};
  for (const device::CoordinatorSummary& summary : *coordinators) {
    if (!isStale(summary)) continue;
    const auto coordinator =
        coordination.coordinatorForApp(summary.kind, summary.identifier, ClientIdentity::CXClientSync,
                                       platform::IfMissing::findNothing, nullptr, nullptr);
    if (coordinator != nullptr) coordinator->cancelForReason(reason, ClientIdentity::CXClientSync).ignore();
  }
}

}  // namespace appsync::daemon
