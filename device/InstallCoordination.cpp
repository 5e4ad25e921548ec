#include "device/InstallCoordination.h"

namespace appsync::device {

namespace {

/// Without coordinators there is nothing to tell the delegate.
class IdleObserver final : public platform::InstallObserver {};

}  // namespace

std::unique_ptr<platform::InstallObserver> InstallCoordination::initWithMachServiceName(
    std::string_view, const std::set<platform::ClientIdentity>&, platform::InstallObserverDelegate&) {
  return std::make_unique<IdleObserver>();
}

}  // namespace appsync::device
