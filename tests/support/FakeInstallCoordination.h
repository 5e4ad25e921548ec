// The install-coordination service.
#pragma once

#include <cstddef>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "platform/InstallCoordination.h"
#include "tests/support/CallJournal.h"

namespace appsync::test {

/// Off at first. Journal lines: "installCoordination.coordinationIsEnabled",
/// "installCoordination.initWithMachServiceName name", "installCoordination.close name".
/// Fails the test when it goes while a connection is open.
class FakeInstallCoordination final : public platform::InstallCoordination {
 public:
  struct Connection {
    std::string serviceName;
    std::set<platform::ClientIdentity> clients;
    platform::InstallObserverDelegate* delegate = nullptr;
    bool isOpen = true;
  };

  explicit FakeInstallCoordination(CallJournal& journal) : journal_(journal) {}
  ~FakeInstallCoordination() override;
  FakeInstallCoordination(const FakeInstallCoordination&) = delete;
  FakeInstallCoordination& operator=(const FakeInstallCoordination&) = delete;

  void enable();
  /// Every connection that was ever opened, in order.
  [[nodiscard]] std::vector<Connection> connections() const;

  [[nodiscard]] bool coordinationIsEnabled() override;
  [[nodiscard]] std::shared_ptr<platform::InstallCoordinator> coordinatorForApp(platform::CoordinatorKind,
                                                                                std::string_view,
                                                                                platform::ClientIdentity,
                                                                                platform::IfMissing, bool*,
                                                                                ErrorSlot) override {
    return nullptr;
  }
  [[nodiscard]] std::shared_ptr<platform::Placeholder> initAppPlaceholder(std::string_view, std::string_view,
                                                                          platform::TSInstallType,
                                                                          platform::ClientIdentity) override {
    return nullptr;
  }
  [[nodiscard]] std::shared_ptr<platform::PromisedTransferToPath> makePromisedTransferToPath(
      std::string_view, platform::ClientIdentity, const std::optional<platform::FileLocation>&,
      std::uint64_t) override {
    return nullptr;
  }
  [[nodiscard]] std::shared_ptr<platform::PromisedOutOfBandTransfer> makePromisedOutOfBandTransfer(
      std::string_view, platform::ClientIdentity, std::uint64_t) override {
    return nullptr;
  }
  void uninstallApp(std::string_view, platform::UserConfirmation, UninstallCompletion completion) override {
    completion(std::nullopt);
  }
  [[nodiscard]] Error createUserPresentableError(long code, const plist::Dictionary&, const Error&) override {
    return {std::string(platform::kInstallCoordinationErrorDomain), code, {}, nullptr};
  }
  [[nodiscard]] std::unique_ptr<platform::InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<platform::ClientIdentity>& clients,
      platform::InstallObserverDelegate& delegate) override;

 private:
  class Observer;
  void close(std::size_t index);

  CallJournal& journal_;
  mutable std::mutex mutex_;
  bool isEnabled_ = false;
  std::vector<Connection> connections_;
};

}  // namespace appsync::test
