// Contract of platform/InstallCoordination.h, InstallCoordinator.h, InstallObserver.h, InstallPromise.h and
// Placeholder.h.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/AppRegistry.h"
#include "platform/InstallCoordination.h"
#include "platform/UninstalledAppsList.h"

namespace appsync::test {

class InstallCoordinationSubject {
 public:
  virtual ~InstallCoordinationSubject() = default;

  [[nodiscard]] virtual platform::InstallCoordination& coordination() = 0;
};

/// For every service, including those of devices that install without coordinators.
class InstallCoordinationContract : public Contract<InstallCoordinationSubject> {
 protected:
  platform::InstallObserverDelegate delegate;
};

/// For services of devices that install through coordinators.
class CoordinatedInstallSubject {
 public:
  virtual ~CoordinatedInstallSubject() = default;

  /// Initially without coordinators.
  [[nodiscard]] virtual platform::InstallCoordination& coordination() = 0;
  /// The registry in which the service installs apps and placeholders; initially empty.
  [[nodiscard]] virtual platform::AppRegistry& registry() = 0;
  [[nodiscard]] virtual platform::UninstalledAppsList& uninstalledApps() = 0;

  // Each creates a file for a promise at a new path. Thread-safe.
  [[nodiscard]] virtual platform::FileLocation makePackage(std::string_view identifier, std::string_view version) = 0;
  [[nodiscard]] virtual platform::FileLocation makeDamagedPackage(std::string_view identifier) = 0;
  /// A PNG file.
  [[nodiscard]] virtual platform::FileLocation makeIcon() = 0;
  [[nodiscard]] virtual bool exists(const platform::FileLocation& location) = 0;

  // Actions of the user on an app that is being installed.
  virtual void prioritize(std::string_view identifier) = 0;
  virtual void cancelByUser(std::string_view identifier) = 0;

  /// Blocks until the service has no pending operations or callbacks.
  virtual void waitUntilIdle() = 0;

  // Optional: the default implementations skip the tests that need them.

  /// Returns the store metadata of an installed app, or nullopt if not supported.
  [[nodiscard]] virtual std::optional<plist::Dictionary> storeMetadataOf(std::string_view identifier) {
    static_cast<void>(identifier);
    return std::nullopt;
  }
  /// Restarts the service's process. Returns false if not supported. The tests hold no object of the service then.
  [[nodiscard]] virtual bool restart() { return false; }
};

class CoordinatedInstallContract : public Contract<CoordinatedInstallSubject> {
 protected:
  using Client = platform::ClientIdentity;
  using Kind = platform::CoordinatorKind;
  using Coordinator = std::shared_ptr<platform::InstallCoordinator>;
  using Asset = std::shared_ptr<platform::PromisedTransferToPath>;
  using UserData = std::shared_ptr<platform::PromisedOutOfBandTransfer>;
  using AppPlaceholder = std::shared_ptr<platform::Placeholder>;

  static constexpr Client kSync = Client::CXClientSync;
  static constexpr Client kStore = Client::CXClientBazaarly;

  [[nodiscard]] platform::InstallCoordination& service() { return subject().coordination(); }

  /// Finds or creates the coordinator. Fails the test if the service returns null.
  [[nodiscard]] Coordinator coordinator(std::string_view identifier, Kind kind = Kind::initiating,
                                        Client client = kSync);
  [[nodiscard]] Coordinator find(std::string_view identifier, Kind kind = Kind::any, Client client = kSync);

  [[nodiscard]] Asset makeAsset(std::string_view name = "asset", Client client = kSync);
  [[nodiscard]] UserData makeUserData(std::string_view name = "data", Client client = kSync);
  [[nodiscard]] AppPlaceholder makePlaceholder(std::string_view identifier,
                                               platform::TSInstallType installType = platform::TSInstallType::Restore);
  /// The placeholder's configuration is complete.
  [[nodiscard]] AppPlaceholder makeConfiguredPlaceholder(std::string_view identifier);
  [[nodiscard]] static platform::InstallOptions options();

  /// Sets everything that the install needs. Returns the app-asset promise, which is not complete.
  [[nodiscard]] Asset prepare(platform::InstallCoordinator& coordinator);
  /// Fulfils the promise with `package`.
  static void deliver(platform::PromisedTransferToPath& asset, const platform::FileLocation& package);
  /// Installs an app through a new coordinator.
  void install(std::string_view identifier, std::string_view version);

  [[nodiscard]] static Error reason();
  /// Cancels as the coordinator's creator.
  [[nodiscard]] static Status cancel(platform::InstallCoordinator& coordinator);

  /// "installed", "placeholder", "both" or "absent".
  [[nodiscard]] std::string stateOf(std::string_view identifier);
  [[nodiscard]] std::optional<std::string> versionOf(std::string_view identifier);
};

}  // namespace appsync::test
