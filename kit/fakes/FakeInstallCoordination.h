// The install-coordination service.
#pragma once

#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CoordinationState.h"
#include "platform/InstallCoordination.h"

namespace appsync::test {

/// Initially disabled, and without automatic actions: tests trigger each event. Journal lines:
/// "installCoordination.coordinatorForApp initiating com.a create" (or "find"),
/// "installCoordination.initAppPlaceholder com.a 4 Name", "installCoordination.makePromisedTransferToPath com.a-Asset 0
/// /path" (or without a path), "installCoordination.makePromisedOutOfBandTransfer com.a-UserData 0",
/// "installCoordination.uninstallApp com.a" (or "com.a ask"), "installCoordination.createUserPresentableError 1",
/// "installCoordination.coordinationIsEnabled", "installCoordination.initWithMachServiceName name",
/// "installCoordination.close name".
///
/// For the objects that it returns, each call except getters of constant values (`name`, `client`, `kind`, ...):
/// "coordinator.hasInstallOptions com.a", "coordinator.setInitialODRAssetPromises com.a 0" (how many),
/// "coordinator.setAppAssetPromise com.a com.a-Asset", "coordinator.setPlaceholderPromise com.a" (or "com.a none"),
/// "coordinator.setAppAssetPromiseResponsibleClient com.a 1", "coordinator.cancelForReason com.a ZTError 30 3" (domain,
/// code, client), "placeholder.setIconPromise com.a com.a-Icon", "placeholder.setMetadata com.a" (or "com.a none"),
/// "promise.setPercentComplete com.a-Asset 0.5", "promise.setComplete com.a-Asset", "promise.setTransferPath
/// com.a-Asset /path", "promise.cancelForReason com.a-Asset ZTError 30 3" and so on.
///
/// Fails the test if it is destroyed while a connection is open or an object of it is held, if a client changes a
/// coordinator of another client, or if it receives an object of another service.
class FakeInstallCoordination final : public platform::InstallCoordination {
 public:
  using Connection = CoordinationState::Connection;

  FakeInstallCoordination(CallJournal& journal, FakeFileSystem& files, FakeAppRegistry& registry);
  ~FakeInstallCoordination() override;
  FakeInstallCoordination(const FakeInstallCoordination&) = delete;
  FakeInstallCoordination& operator=(const FakeInstallCoordination&) = delete;

  void enable();
  /// Enables automatic actions, on a thread of the service: coordinators show placeholders in the registry, install
  /// packages there and notify observers as the contract says.
  void installAutomatically();
  void completeUninstalls(CallbackOn where);

  /// Failures by operation and subject: `failNext("coordinator.setInstallOptions", "com.a", error)`. The subject of a
  /// promise is its name. `kShowingPlaceholder` is an operation too. To make an install fail, use the registry's
  /// failures.
  FailurePlan<std::string>& failures;
  /// Stops the service's thread before each action: showing, installing, uninstalling, a callback.
  Gate& gate;
  /// Blocks until there are no pending actions or callbacks.
  void waitUntilIdle() { state_->thread().waitUntilIdle(); }
  /// Opens a closed gate until there are no pending actions or callbacks, then closes it.
  void runUntilIdle();

  // Contents, as copies. If several objects match, the latest.
  void add(const FakeCoordinator& coordinator);
  [[nodiscard]] std::optional<FakeCoordinator> coordinator(std::string_view identifier) const;
  [[nodiscard]] std::vector<FakeCoordinator> coordinators() const;
  /// Ended coordinators, in the order of their ends.
  [[nodiscard]] std::vector<FakeCoordinator> endedCoordinators() const;
  /// Every placeholder and promise ever created, in order, including destroyed ones.
  [[nodiscard]] std::vector<FakePlaceholder> placeholders() const;
  [[nodiscard]] std::optional<FakePlaceholder> placeholder(std::string_view identifier) const;
  [[nodiscard]] std::vector<FakePromise> promises() const;
  [[nodiscard]] std::optional<FakePromise> promise(std::string_view name) const;
  /// Names of promises and identifiers of placeholders that are neither attached nor cancelled.
  [[nodiscard]] std::vector<std::string> abandoned() const;
  /// Every connection ever opened, in order.
  [[nodiscard]] std::vector<Connection> connections() const;

  // Events of the app's first coordinator, with their callbacks; those on the calling thread run before the return.
  void didInstallPlaceholder(std::string_view identifier, std::optional<Error> error = std::nullopt,
                             CallbackOn where = CallbackOn::ownThread);
  /// Ends the coordinator. Installs nothing.
  void complete(std::string_view identifier, std::optional<Error> error = std::nullopt,
                CallbackOn where = CallbackOn::ownThread);
  void prioritize(std::string_view identifier, CallbackOn where = CallbackOn::ownThread);
  void pause(std::string_view identifier, CallbackOn where = CallbackOn::ownThread);
  void resume(std::string_view identifier, CallbackOn where = CallbackOn::ownThread);
  void beginRestoringUserData(std::string_view identifier, CallbackOn where = CallbackOn::ownThread);
  void cancelByUser(std::string_view identifier, CallbackOn where = CallbackOn::ownThread);
  void cancel(std::string_view identifier, FakeCancellation cancellation, CallbackOn where = CallbackOn::ownThread);

  [[nodiscard]] bool coordinationIsEnabled() override;
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

 private:
  class Observer;

  explicit FakeInstallCoordination(std::shared_ptr<CoordinationState> state);
  /// Applies `event` to the app's first coordinator. Fails the test if there is none.
  template <class Event>
  void apply(std::string_view identifier, CallbackOn where, const Event& event);
  void notify(std::string_view identifier, CallbackOn where,
              void (platform::InstallObserverDelegate::*callback)(platform::InstallCoordinator&));
  Status uninstall(const std::string& identifier);

  const std::shared_ptr<CoordinationState> state_;
};

}  // namespace appsync::test
