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

/// How far a coordinator is.
enum class CoordinatorPhase : std::uint8_t {
  preparing,   ///< nobody has promised its package yet
  loading,     ///< its package is on its way
  waiting,     ///< its package is there, something else is missing
  installing,  ///< its app is being installed, or about to be
};

/// A coordinator, for people to see.
struct CoordinatorSummary {
  std::string identifier;
  /// The placeholder's, or the identifier.
  std::string name;
  platform::CoordinatorKind kind = platform::CoordinatorKind::initiating;
  platform::ClientIdentity creator = platform::ClientIdentity::CXClientSync;
  CoordinatorPhase phase = CoordinatorPhase::preparing;
  /// Of the package, from 0 to 1.
  double fraction = 0;
};

/// Installs several apps at once, on threads of its own. Coordinators outlive the process: the next one that holds the
/// device takes them up where they were, and installs at once what only lacked that.
///
/// Where coordination is off there are no coordinators, placeholders or promises to be had; apps can be removed.
///
/// Identifiers are bundle identifiers of this device, see `isBundleIdentifier`; no other gets a coordinator or
/// placeholder.
class InstallCoordination final : public platform::InstallCoordination {
 public:
  static constexpr const char* kSchema = coordinator_table::kSchema;

  /// All must outlive the service. Coordination is on or off for the service's whole life.
  InstallCoordination(Database& database, DeviceFileSystem& files, AppRegistry& registry, Settings& settings,
                      Access access);
  /// Finishes what is being installed or removed; see `Coordinators::end`.
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
  /// Nobody is asked on this device. Coordinators are cancelled in the name of the device's user. An app that is just
  /// being installed is removed once that has ended.
  void uninstallApp(std::string_view bundleIdentifier, platform::UserConfirmation confirmation,
                    UninstallCompletion completion) override;
  [[nodiscard]] Error createUserPresentableError(long code, const plist::Dictionary& information,
                                                 const Error& underlying) override;
  [[nodiscard]] std::unique_ptr<platform::InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<platform::ClientIdentity>& clients,
      platform::InstallObserverDelegate& delegate) override;

  // What only tools need.

  /// The user tapped an app that is on its way: it comes before the others in the registry's order, and observers hear
  /// of it. False when there is no coordinator for it.
  bool prioritize(std::string_view bundleIdentifier);

  /// The user deleted an app that is on its way: all its coordinators are cancelled with `CXClientUser` and the reason
  /// "cancelled on the device". An app under the placeholder stays. Fails when there is none, and while one installs.
  Status cancelByUser(std::string_view bundleIdentifier);

  /// Every coordinator, the oldest first; a reader of the device sees what its holder stored last.
  [[nodiscard]] Result<std::vector<CoordinatorSummary>> list();

  /// Waits until no app is being installed or removed and everybody has been told; false if that takes longer.
  /// Coordinators that lack something are not waited for. Not in callbacks.
  [[nodiscard]] bool waitUntilIdle(std::chrono::milliseconds patience);

 private:
  Database& database_;
  const Access access_;
  const bool isEnabled_;
  const std::shared_ptr<Coordinators> coordinators_;
};

}  // namespace appsync::device
