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

/// Threads: any number of installs and removals at once, also of one app: the last one to be recorded counts.
class Installer {
 public:
  /// All must outlive the installer.
  Installer(Database& database, DeviceFileSystem& files, RunningInstalls& running)
      : database_(database), files_(files), running_(running) {}

  /// As `platform::AppRegistry::installApplication`; an app that is new to the device becomes one of `applicationType`.
  [[nodiscard]] Status install(const platform::FileLocation& location, const plist::Dictionary& options,
                               std::string_view applicationType);

  /// The same for a package and a request that was checked.
  [[nodiscard]] Status installPackage(const platform::FileLocation& location, const InstallRequest& request,
                                      std::string_view applicationType);

  /// Makes a settled container the app's placeholder, whose install waits from now on unless the app is demoted.
  [[nodiscard]] Status recordPlaceholder(PendingContainer& container, const InstallRequest& request,
                                         std::string_view applicationType, StoredBundle bundle);

  // Of demoted apps, as in `AppRegistry`.
  [[nodiscard]] Status demote(std::string_view bundleIdentifier, platform::TSInstallType type);
  [[nodiscard]] Status setPlaceholderType(std::string_view bundleIdentifier, platform::TSInstallType type);
  [[nodiscard]] Status renamePlaceholder(std::string_view bundleIdentifier, std::string_view name);
  [[nodiscard]] bool isDemoted(std::string_view bundleIdentifier);
  [[nodiscard]] Status beginReturn(std::string_view bundleIdentifier, const TransactionHook& transactionHook);

  /// As `platform::AppRegistry::uninstallApplication`.
  [[nodiscard]] Status uninstall(std::string_view bundleIdentifier, const plist::Dictionary& options,
                                 const TransactionHook& transactionHook = {});

 private:
  [[nodiscard]] Status installPlaceholder(const platform::FileLocation& location, const InstallRequest& request,
                                          std::string_view applicationType);
  [[nodiscard]] Status unpackAndRecord(const platform::FileLocation& location, const InstallRequest& request,
                                       std::string_view applicationType, InstallProgress& progress);
  /// Makes a settled container the app's bundle in its role, and removes those that it takes the place of.
  [[nodiscard]] Status record(PendingContainer& container, const InstallRequest& request,
                              std::string_view applicationType, StoredBundle bundle);
  /// The app's row, or one of an app that is new.
  [[nodiscard]] Result<AppRow> known(std::string_view identifier);

  Database& database_;
  DeviceFileSystem& files_;
  RunningInstalls& running_;
};

}  // namespace appsync::device
