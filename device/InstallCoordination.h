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

  [[nodiscard]] std::shared_ptr<platform::InstallCoordinator> coordinatorForApp(
      platform::CoordinatorKind kind, std::string_view bundleIdentifier, platform::ClientIdentity client,
      platform::IfMissing ifMissing, bool* created, ErrorSlot error) override;
  [[nodiscard]] std::shared_ptr<platform::Placeholder> initAppPlaceholder(std::string_view bundleName,
                                                                          std::string_view bundleIdentifier,
                                                                          platform::TSInstallType installType,
                                                                          platform::ClientIdentity client) override;
  [[nodiscard]] std::shared_ptr<platform::PromisedTransferToPath> makePromisedTransferToPath(
      std::string_view name, platform::ClientIdentity client, const std::optional<platform::FileLocation>& transferPath,
      std::uint64_t diskSpaceNeeded) override;
  [[nodiscard]] std::shared_ptr<platform::PromisedOutOfBandTransfer> makePromisedOutOfBandTransfer(
      std::string_view name, platform::ClientIdentity client, std::uint64_t diskSpaceNeeded) override;
  void uninstallApp(std::string_view bundleIdentifier, platform::UserConfirmation confirmation,
                    UninstallCompletion completion) override;
  [[nodiscard]] Error createUserPresentableError(long code, const plist::Dictionary& information,
                                                 const Error& underlying) override;

  [[nodiscard]] std::unique_ptr<platform::InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<platform::ClientIdentity>& clients,
      platform::InstallObserverDelegate& delegate) override;
};

}  // namespace appsync::device
