// Holds install-coordination services to platform/InstallCoordination.h and the headers of what it hands out.
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

/// What any such service does, also that of a device which installs without coordinators.
class InstallCoordinationContract : public Contract<InstallCoordinationSubject> {
 protected:
  platform::InstallObserverDelegate delegate;
};

/// A device that installs through coordinators.
class CoordinatedInstallSubject {
 public:
  virtual ~CoordinatedInstallSubject() = default;

  /// Has no coordinators at first.
  [[nodiscard]] virtual platform::InstallCoordination& coordination() = 0;
  /// Where placeholders and apps go; empty at first.
  [[nodiscard]] virtual platform::AppRegistry& registry() = 0;
  [[nodiscard]] virtual platform::UninstalledAppsList& uninstalledApps() = 0;

  // Files for promises, each at a path of its own. Threads: any.
  [[nodiscard]] virtual platform::FileLocation makePackage(std::string_view identifier, std::string_view version) = 0;
  [[nodiscard]] virtual platform::FileLocation makeDamagedPackage(std::string_view identifier) = 0;
  /// A PNG picture.
  [[nodiscard]] virtual platform::FileLocation makeIcon() = 0;
  [[nodiscard]] virtual bool exists(const platform::FileLocation& location) = 0;

  // What the person who holds the device does to an app that is being installed.
  virtual void prioritize(std::string_view identifier) = 0;
  virtual void cancelByUser(std::string_view identifier) = 0;

  /// Blocks until the service has nothing left to do and to tell.
  virtual void waitUntilIdle() = 0;

  // What a device cannot do is not tested.

  /// The store metadata that is kept with an installed app.
  [[nodiscard]] virtual std::optional<plist::Dictionary> storeMetadataOf(std::string_view identifier) {
    static_cast<void>(identifier);
    return std::nullopt;
  }
  /// Ends the process of the service and begins another; false where that cannot be. Nothing of the service is held.
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

  /// The coordinator of that kind, made if there is none; fails the test when there is none then.
  [[nodiscard]] Coordinator coordinator(std::string_view identifier, Kind kind = Kind::initiating,
                                        Client client = kSync);
  [[nodiscard]] Coordinator find(std::string_view identifier, Kind kind = Kind::any, Client client = kSync);

  [[nodiscard]] Asset makeAsset(std::string_view name = "asset", Client client = kSync);
  [[nodiscard]] UserData makeUserData(std::string_view name = "data", Client client = kSync);
  [[nodiscard]] AppPlaceholder makePlaceholder(std::string_view identifier,
                                               platform::TSInstallType installType = platform::TSInstallType::Restore);
  /// With its configuration complete.
  [[nodiscard]] AppPlaceholder makeConfiguredPlaceholder(std::string_view identifier);
  [[nodiscard]] static platform::InstallOptions options();

  /// Gives the coordinator all that its app needs but the package, which is promised.
  [[nodiscard]] Asset prepare(platform::InstallCoordinator& coordinator);
  /// Fulfils the promise with what is there.
  static void deliver(platform::PromisedTransferToPath& asset, const platform::FileLocation& package);
  /// Installs an app through a coordinator of its own.
  void install(std::string_view identifier, std::string_view version);

  [[nodiscard]] static Error reason();
  /// Cancels as the one who made it.
  [[nodiscard]] static Status cancel(platform::InstallCoordinator& coordinator);

  /// "installed", "placeholder", "both" or "absent".
  [[nodiscard]] std::string stateOf(std::string_view identifier);
  [[nodiscard]] std::optional<std::string> versionOf(std::string_view identifier);
};

}  // namespace appsync::test
