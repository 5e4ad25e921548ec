// The install-coordination service.
#pragma once

#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "device/coordination/Coordinators.h"
#include "device/services/Settings.h"
#include "device/storage/Access.h"
#include "platform/InstallCoordination.h"

namespace appsync::device {

/// The phase of a coordinator, for users.
enum class CoordinatorPhase : std::uint8_t {
  preparing,   ///< without a promise of its package
  loading,     ///< its package is being loaded
  waiting,     ///< its package is complete, another condition is not met
  installing,  ///< its app is being installed or queued
};

/// The description of a coordinator for users.
struct CoordinatorSummary {
  std::string identifier;
  /// The placeholder's name, or the identifier.
  std::string name;
  platform::CoordinatorKind kind = platform::CoordinatorKind::initiating;
  platform::ClientIdentity creator = platform::ClientIdentity::CXClientSync;
  CoordinatorPhase phase = CoordinatorPhase::preparing;
  /// The loaded fraction of the package, from 0 to 1.
  double fraction = 0;
};

/// Installs several apps at once on its own threads. Coordinators are stored in the device's database: the next process
/// with exclusive access resumes them and installs the apps that are ready. Thread-safe.
///
/// If coordination is off, coordinators, placeholders and promises are not available; apps can be removed.
///
/// Rejects invalid bundle identifiers; see `isBundleIdentifier`.
class InstallCoordination final : public platform::InstallCoordination {
 public:
  static constexpr const char* kSchema = coordinator_table::kSchema;

  /// All references must outlive the service, which reads the setting "coordination" only here.
  InstallCoordination(Database& database, DeviceFileSystem& files, AppRegistry& registry, Settings& settings,
                      Access access);
  /// Finishes running installs and removals; see `Coordinators::end`.
  ~InstallCoordination() override;
  InstallCoordination(const InstallCoordination&) = delete;
  InstallCoordination& operator=(const InstallCoordination&) = delete;

  [[nodiscard]] bool coordinationIsEnabled() override { return isEnabled_; }
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
  /// Never asks for confirmation. Cancels the app's coordinators as the user. Removes an app that is being installed
  /// after the install has ended.
  void uninstallApp(std::string_view bundleIdentifier, platform::UserConfirmation confirmation,
                    UninstallCompletion completion) override;
  [[nodiscard]] Error createUserPresentableError(long code, const plist::Dictionary& information,
                                                 const Error& underlying) override;
  [[nodiscard]] std::unique_ptr<platform::InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<platform::ClientIdentity>& clients,
      platform::InstallObserverDelegate& delegate) override;

  // For tools.

  /// Moves the install of an app, which the user tapped, to the front of the registry's order and notifies observers.
  /// Returns false if the app has no coordinator.
  bool prioritize(std::string_view bundleIdentifier);

  /// Cancels all coordinators of an app, which the user deleted, with `CXClientUser` and the reason "cancelled on the
  /// device". Keeps an app under the placeholder. Fails if there is no coordinator or one is installing.
  Status cancelByUser(std::string_view bundleIdentifier);

  /// Returns every coordinator, the oldest first; on a read-only device, as last stored by another process.
  [[nodiscard]] Result<std::vector<CoordinatorSummary>> list();

  /// Blocks until all installs, removals and callbacks have ended. Does not wait for coordinators that are not ready.
  /// Returns false on time-out. Must not be called from a callback.
  [[nodiscard]] bool waitUntilIdle(std::chrono::milliseconds timeout);

 private:
  Database& database_;
  const Access access_;
  const bool isEnabled_;
  const std::shared_ptr<Coordinators> coordinators_;
};

}  // namespace appsync::device
