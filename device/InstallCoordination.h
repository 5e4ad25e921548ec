// The install-coordination service of a device that installs directly.
#pragma once

#include <memory>
#include <set>
#include <string_view>

#include "platform/InstallCoordination.h"

namespace appsync::device {

/// Coordination is off: there are no coordinators, and connections, which may be opened all the same, have nothing to
/// report.
class InstallCoordination final : public platform::InstallCoordination {
 public:
  [[nodiscard]] bool coordinationIsEnabled() override { return false; }

  [[nodiscard]] std::unique_ptr<platform::InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<platform::ClientIdentity>& clients,
      platform::InstallObserverDelegate& delegate) override;
};

}  // namespace appsync::device
