// The device's registry of apps.
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "device/apps/AppRecord.h"
#include "device/apps/Installer.h"
#include "device/apps/RegistryObservers.h"
#include "device/apps/RunningInstalls.h"
#include "device/storage/Access.h"
#include "platform/AppRegistry.h"

namespace appsync::device {

/// Enumerates apps in the order of their first installation. Thread-safe.
class AppRegistry final : public platform::AppRegistry {
 public:
  static constexpr const char* kSchema = app_table::kSchema;

  /// `database` and `files` must outlive the registry. With `Access::readOnly` the progress of installs is what another
  /// process stored last.
  AppRegistry(Database& database, DeviceFileSystem& files, Access access);

  void addObserver(platform::AppRegistryObserver& observer) override;
  void removeObserver(platform::AppRegistryObserver& observer) override;
  /// Returns false if the registry cannot be read.
  [[nodiscard]] bool applicationIsInstalled(std::string_view bundleIdentifier) override;
  [[nodiscard]] std::shared_ptr<const platform::AppRecord> recordForIdentifier(
      std::string_view bundleIdentifier, platform::PlaceholderLookup placeholders) override;
  void enumerateBundlesOfType(
      platform::BundleKind kind,
      const std::function<void(const platform::BundleRecord& bundle, bool& stop)>& visit) override;
  [[nodiscard]] Status installApplication(const platform::FileLocation& location,
                                          const plist::Dictionary& options) override;
  [[nodiscard]] Status uninstallApplication(std::string_view bundleIdentifier,
                                            const plist::Dictionary& options = {}) override;
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> installProgressForApplication(
      const platform::AppRecord& record, platform::TSInstallPhase phase) override;
  void installPhaseFinishedForProgress(platform::InstallProgress& progress) override;

  // For install coordination, with validated requests.

  [[nodiscard]] Status installPackage(const platform::FileLocation& location, const InstallRequest& request);
  [[nodiscard]] Status recordPlaceholder(PendingContainer& container, const InstallRequest& request,
                                         StoredBundle bundle);
  /// Removes the placeholder. Fails for an unknown app.
  [[nodiscard]] Status removePlaceholder(std::string_view bundleIdentifier, const TransactionHook& transactionHook);
  [[nodiscard]] RunningInstalls& runningInstalls() noexcept { return *running_; }
  /// Returns whether the app is demoted.
  [[nodiscard]] bool isDemoted(std::string_view bundleIdentifier) { return installer_.isDemoted(bundleIdentifier); }
  /// Starts the install of a demoted app, which uses the existing placeholder.
  [[nodiscard]] Status beginReturn(std::string_view bundleIdentifier, const TransactionHook& transactionHook) {
    return installer_.beginReturn(bundleIdentifier, transactionHook);
  }

  /// Installs a system app or its placeholder, as `installApplication` does.
  [[nodiscard]] Status installSystemApplication(const platform::FileLocation& location,
                                                const plist::Dictionary& options);

  /// Demotes an installed app: replaces its bundle by a placeholder of `type` with its icon, name, version, store
  /// metadata and licence. Keeps its data. Fails for an app that is not installed, or is being updated.
  [[nodiscard]] Status demote(std::string_view bundleIdentifier, platform::TSInstallType type) {
    return installer_.demote(bundleIdentifier, type);
  }

  /// Changes the install type of the placeholder of an app that is not installed. Starts its install, or ends it if
  /// `type` is a demotion. Fails for other apps.
  [[nodiscard]] Status setPlaceholderType(std::string_view bundleIdentifier, platform::TSInstallType type) {
    return installer_.setPlaceholderType(bundleIdentifier, type);
  }

  /// Changes the display name of the placeholder of an app that is not installed. Fails for other apps.
  [[nodiscard]] Status renamePlaceholder(std::string_view bundleIdentifier, std::string_view name) {
    return installer_.renamePlaceholder(bundleIdentifier, name);
  }

  /// Moves the running install of the app to the front of the order.
  void prioritizeInstall(std::string_view bundleIdentifier) { running_->prioritize(bundleIdentifier); }

  /// Returns the error of the app's latest install by this process, or nullopt if it succeeded or there was none.
  [[nodiscard]] std::optional<Error> lastInstallFailure(std::string_view bundleIdentifier);

  /// Returns every app, in the order of enumeration.
  [[nodiscard]] Result<std::vector<std::shared_ptr<const AppRecord>>> apps();

  /// Replaces the licence data of the app and its placeholder. Fails for an unknown app.
  [[nodiscard]] Status setLicenceData(std::string_view bundleIdentifier, ByteView licence);

  /// Returns the licence data of the app or its placeholder, or nullopt if there is none.
  [[nodiscard]] Result<std::optional<Bytes>> licenceData(std::string_view bundleIdentifier);

 private:
  [[nodiscard]] std::optional<AppRow> find(std::string_view bundleIdentifier);
  [[nodiscard]] std::shared_ptr<const AppRecord> recordOf(AppRow row);
  void noteOutcome(std::string_view bundleIdentifier, const Status& installed);

  Database& database_;
  const Access access_;
  const std::shared_ptr<RunningInstalls> running_;
  Installer installer_;
  std::mutex failuresMutex_;
  std::map<std::string, Error, std::less<>> failures_;
  /// Declared last so that it is destroyed first: its thread uses `running_`.
  RegistryObservers observers_;
};

}  // namespace appsync::device
