// Installs and removes apps.
#pragma once

#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/apps/Containers.h"
#include "device/apps/InstallRequest.h"
#include "device/apps/RunningInstalls.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"
#include "platform/FileLocation.h"
#include "plist/PropertyList.h"

namespace appsync::device {

/// Thread-safe. Of concurrent installs and removals of one app the last one to be recorded takes effect.
class Installer {
 public:
  /// All arguments must outlive the installer.
  Installer(Database& database, DeviceFileSystem& files, RunningInstalls& running)
      : database_(database), files_(files), running_(running) {}

  /// Implements `platform::AppRegistry::installApplication`. A new app gets `applicationType`.
  [[nodiscard]] Status install(const platform::FileLocation& location, const plist::Dictionary& options,
                               std::string_view applicationType);

  /// Installs a package with a validated request.
  [[nodiscard]] Status installPackage(const platform::FileLocation& location, const InstallRequest& request,
                                      std::string_view applicationType);

  /// Records a committed container as the app's placeholder and starts its install, unless the app is demoted.
  [[nodiscard]] Status recordPlaceholder(PendingContainer& container, const InstallRequest& request,
                                         std::string_view applicationType, StoredBundle bundle);

  // Demoted apps: see `AppRegistry`.
  [[nodiscard]] Status demote(std::string_view bundleIdentifier, platform::TSInstallType type);
  [[nodiscard]] Status setPlaceholderType(std::string_view bundleIdentifier, platform::TSInstallType type);
  [[nodiscard]] Status renamePlaceholder(std::string_view bundleIdentifier, std::string_view name);
  [[nodiscard]] bool isDemoted(std::string_view bundleIdentifier);
  [[nodiscard]] Status beginReturn(std::string_view bundleIdentifier, const TransactionHook& transactionHook);

  /// Implements `platform::AppRegistry::uninstallApplication`.
  [[nodiscard]] Status uninstall(std::string_view bundleIdentifier, const plist::Dictionary& options,
                                 const TransactionHook& transactionHook = {});

 private:
  [[nodiscard]] Status installPlaceholder(const platform::FileLocation& location, const InstallRequest& request,
                                          std::string_view applicationType);
  [[nodiscard]] Status unpackAndRecord(const platform::FileLocation& location, const InstallRequest& request,
                                       std::string_view applicationType, InstallProgress& progress);
  /// Records a committed container as the app's bundle in its role and removes the bundles that it replaces.
  [[nodiscard]] Status record(PendingContainer& container, const InstallRequest& request,
                              std::string_view applicationType, StoredBundle bundle);
  /// Returns the app's row, or a row without bundles for an unknown app.
  [[nodiscard]] Result<AppRow> known(std::string_view identifier);

  Database& database_;
  DeviceFileSystem& files_;
  RunningInstalls& running_;
};

}  // namespace appsync::device
