// Contract of platform/AppRegistry.h, AppRecord.h and InstallProgress.h.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "kit/contracts/Contract.h"
#include "platform/AppRegistry.h"
#include "platform/UninstalledAppsList.h"

namespace appsync::test {

class AppRegistrySubject {
 public:
  virtual ~AppRegistrySubject() = default;

  /// Initially empty.
  [[nodiscard]] virtual platform::AppRegistry& registry() = 0;
  /// The list to which the registry adds removed apps.
  [[nodiscard]] virtual platform::UninstalledAppsList& uninstalledApps() = 0;

  // Each creates an item to install at a new location.
  [[nodiscard]] virtual platform::FileLocation makePackage(std::string_view identifier, std::string_view version) = 0;
  [[nodiscard]] virtual platform::FileLocation makeDamagedPackage(std::string_view identifier) = 0;
  [[nodiscard]] virtual platform::FileLocation makePlaceholderFolder(std::string_view identifier,
                                                                     std::string_view version) = 0;
  /// Deletes such an item.
  virtual void removeLocation(const platform::FileLocation& location) = 0;
  /// Returns a text that differs for different contents of the location.
  [[nodiscard]] virtual std::string fingerprint(const platform::FileLocation& location) = 0;

  /// Returns true if the app's bundle exists at this device path and can be launched.
  [[nodiscard]] virtual bool isUsable(std::string_view bundlePath) = 0;

  /// Changes which installs are prioritized or paused, so that observers are notified.
  virtual void changeInstallOrder() = 0;

  // Optional: the default implementations skip the tests that need them.

  /// Installs a system app. Returns false if not supported.
  [[nodiscard]] virtual bool addSystemApp(std::string_view identifier) {
    static_cast<void>(identifier);
    return false;
  }
  /// Adds a user bundle that is not an app. Returns false if not supported.
  [[nodiscard]] virtual bool addExtension(std::string_view identifier) {
    static_cast<void>(identifier);
    return false;
  }
  /// Returns licence data that is bound to this device, or nullopt if not supported.
  [[nodiscard]] virtual std::optional<std::string> deviceBoundLicence() { return std::nullopt; }
  /// Return what the app was installed with, or nullopt if not supported.
  [[nodiscard]] virtual std::optional<std::string> storeMetadataOf(std::string_view identifier) {
    static_cast<void>(identifier);
    return std::nullopt;
  }
  [[nodiscard]] virtual std::optional<std::string> licenceDataOf(std::string_view identifier) {
    static_cast<void>(identifier);
    return std::nullopt;
  }
  /// Restarts the registry's process. Returns false if not supported.
  [[nodiscard]] virtual bool restart() { return false; }
};

class AppRegistryContract : public Contract<AppRegistrySubject> {
 protected:
  [[nodiscard]] platform::AppRegistry& registry() { return subject().registry(); }

  [[nodiscard]] static plist::Dictionary options(std::string_view packageType, std::string_view identifier);
  [[nodiscard]] Status tryInstall(const platform::FileLocation& package, std::string_view identifier);
  [[nodiscard]] Status tryPlaceholder(const platform::FileLocation& folder, std::string_view identifier);
  void install(std::string_view identifier, std::string_view version = "1.0");
  void placeholder(std::string_view identifier, std::string_view version = "1.0");

  /// Returns the record of an app or placeholder, or null.
  [[nodiscard]] std::shared_ptr<const platform::AppRecord> record(std::string_view identifier);
  /// "installed", "placeholder", "both" or "absent".
  [[nodiscard]] std::string stateOf(std::string_view identifier);
  [[nodiscard]] std::optional<std::string> versionOf(std::string_view identifier);
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> progressOf(std::string_view identifier);
  /// Returns the identifiers of an enumeration, in its order.
  [[nodiscard]] std::vector<std::string> enumerate(platform::BundleKind kind);
  [[nodiscard]] std::vector<std::string> removedApps();
};

}  // namespace appsync::test
