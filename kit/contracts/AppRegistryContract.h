// Holds registers of apps to platform/AppRegistry.h, AppRecord.h and InstallProgress.h.
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

  /// Empty at first.
  [[nodiscard]] virtual platform::AppRegistry& registry() = 0;
  /// The installer's list that removals enter.
  [[nodiscard]] virtual platform::UninstalledAppsList& uninstalledApps() = 0;

  // Things to install, each at a location of its own.
  [[nodiscard]] virtual platform::FileLocation makePackage(std::string_view identifier, std::string_view version) = 0;
  [[nodiscard]] virtual platform::FileLocation makeDamagedPackage(std::string_view identifier) = 0;
  [[nodiscard]] virtual platform::FileLocation makePlaceholderFolder(std::string_view identifier,
                                                                     std::string_view version) = 0;
  /// Takes one of them away again.
  virtual void removeLocation(const platform::FileLocation& location) = 0;
  /// What distinguishes a location's contents from any other contents.
  [[nodiscard]] virtual std::string fingerprint(const platform::FileLocation& location) = 0;

  /// Whether the app's bundle, at this device path, is there and can be launched.
  [[nodiscard]] virtual bool isUsable(std::string_view bundlePath) = 0;

  /// Makes the answer to which installs run first and which are paused another one.
  virtual void changeInstallOrder() = 0;

  // What a registry cannot do is not tested.

  /// Has an app of the system there, installed.
  [[nodiscard]] virtual bool addSystemApp(std::string_view identifier) {
    static_cast<void>(identifier);
    return false;
  }
  /// Has a user's bundle there that is no app.
  [[nodiscard]] virtual bool addExtension(std::string_view identifier) {
    static_cast<void>(identifier);
    return false;
  }
  /// Licence data that is bound to this device.
  [[nodiscard]] virtual std::optional<std::string> deviceBoundLicence() { return std::nullopt; }
  /// What an app was installed with, where it can be told.
  [[nodiscard]] virtual std::optional<std::string> storeMetadataOf(std::string_view identifier) {
    static_cast<void>(identifier);
    return std::nullopt;
  }
  [[nodiscard]] virtual std::optional<std::string> licenceDataOf(std::string_view identifier) {
    static_cast<void>(identifier);
    return std::nullopt;
  }
  /// Ends the process that keeps the registry and begins another.
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

  /// The app's record, also of a placeholder.
  [[nodiscard]] std::shared_ptr<const platform::AppRecord> record(std::string_view identifier);
  /// "installed", "placeholder", "both" or "absent".
  [[nodiscard]] std::string stateOf(std::string_view identifier);
  [[nodiscard]] std::optional<std::string> versionOf(std::string_view identifier);
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> progressOf(std::string_view identifier);
  /// The identifiers that a walk meets.
  [[nodiscard]] std::vector<std::string> walk(platform::BundleKind kind);
  [[nodiscard]] std::vector<std::string> removedApps();
};

}  // namespace appsync::test
