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

/// Off at first, and at first it does nothing of itself: a test says when a coordinator goes on. Journal lines:
/// "installCoordination.coordinatorForApp initiating com.a create" (or "find"),
/// "installCoordination.initAppPlaceholder com.a 4 Name", "installCoordination.makePromisedTransferToPath com.a-Asset 0
/// /path" (or without a path), "installCoordination.makePromisedOutOfBandTransfer com.a-UserData 0",
/// "installCoordination.uninstallApp com.a" (or "com.a ask"), "installCoordination.createUserPresentableError 1",
/// "installCoordination.coordinationIsEnabled", "installCoordination.initWithMachServiceName name",
/// "installCoordination.close name".
///
/// Of what it hands out, each call but `name`, `client`, `kind`, `description` and whatever else never changes:
/// "coordinator.hasInstallOptions com.a", "coordinator.setInitialODRAssetPromises com.a 0" (how many),
/// "coordinator.setAppAssetPromise com.a com.a-Asset", "coordinator.setPlaceholderPromise com.a" (or "com.a none"),
/// "coordinator.setAppAssetPromiseResponsibleClient com.a 1", "coordinator.cancelForReason com.a ZTError 30 3" (domain,
/// code, client), "placeholder.setIconPromise com.a com.a-Icon", "placeholder.setMetadata com.a" (or "com.a none"),
/// "promise.setPercentComplete com.a-Asset 0.5", "promise.setComplete com.a-Asset", "promise.setTransferPath
/// com.a-Asset /path", "promise.cancelForReason com.a-Asset ZTError 30 3" and so on.
///
/// Fails the test when it goes while a connection is open or something that it handed out is held, when a client drives
/// a coordinator of another one, and when it is given what is not its own.
class FakeInstallCoordination final : public platform::InstallCoordination {
 public:
  using Connection = CoordinationState::Connection;

  FakeInstallCoordination(CallJournal& journal, FakeFileSystem& files, FakeAppRegistry& registry);
  ~FakeInstallCoordination() override;
  FakeInstallCoordination(const FakeInstallCoordination&) = delete;
  FakeInstallCoordination& operator=(const FakeInstallCoordination&) = delete;

  void enable();
  /// From now on coordinators go on as the contract says, on a thread of the service's: placeholders are shown in the
  /// registry, apps installed there from their packages, observers told.
  void installAutomatically();
  void completeUninstalls(CallbackOn where);

  /// Failures of calls, by what they are about: `failNext("coordinator.setInstallOptions", "com.a", error)`, promises
  /// by their name; and of `kShowingPlaceholder`. That an install fails is the registry's matter.
  FailurePlan<std::string>& failures;
  /// Stops the service's thread before each step: showing, installing, uninstalling, a callback.
  Gate& gate;
  /// Blocks until everything has been done and told.
  void waitUntilIdle() { state_->thread().waitUntilIdle(); }
  /// With a closed gate: lets everything be done and told, then closes it again.
  void runUntilIdle();

  // What is there. All are copies; of several the latest.
  void add(const FakeCoordinator& coordinator);
  [[nodiscard]] std::optional<FakeCoordinator> coordinator(std::string_view identifier) const;
  [[nodiscard]] std::vector<FakeCoordinator> coordinators() const;
  /// Those that are no more, in the order in which they ended.
  [[nodiscard]] std::vector<FakeCoordinator> endedCoordinators() const;
  /// Every placeholder, every promise that was ever made, in order; also those that were dropped.
  [[nodiscard]] std::vector<FakePlaceholder> placeholders() const;
  [[nodiscard]] std::optional<FakePlaceholder> placeholder(std::string_view identifier) const;
  [[nodiscard]] std::vector<FakePromise> promises() const;
  [[nodiscard]] std::optional<FakePromise> promise(std::string_view name) const;
  /// Names of promises and identifiers of placeholders that are neither somebody's nor cancelled.
  [[nodiscard]] std::vector<std::string> abandoned() const;
  /// Every connection that was ever opened, in order.
  [[nodiscard]] std::vector<Connection> connections() const;

  // What happens to the app's first coordinator, and is told. On the calling thread it has been told on return.
  void didInstallPlaceholder(std::string_view identifier, std::optional<Error> error = std::nullopt,
                             CallbackOn where = CallbackOn::ownThread);
  /// The coordinator is gone then; nothing is installed.
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
  /// Makes something happen to the app's first coordinator; fails the test when there is none.
  template <class Event>
  void happen(std::string_view identifier, CallbackOn where, const Event& event);
  void tell(std::string_view identifier, CallbackOn where,
            void (platform::InstallObserverDelegate::*callback)(platform::InstallCoordinator&));
  Status uninstall(const std::string& identifier);

  const std::shared_ptr<CoordinationState> state_;
};

}  // namespace appsync::test
