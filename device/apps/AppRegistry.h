// The device's register of apps.
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

/// Walks are in the order in which apps came to the device; an update keeps an app's place.
class AppRegistry final : public platform::AppRegistry {
 public:
  static constexpr const char* kSchema = app_table::kSchema;

  /// Both must outlive the registry. With `Access::readOnly` progress is what another process stored last.
  AppRegistry(Database& database, DeviceFileSystem& files, Access access);

  void addObserver(platform::AppRegistryObserver& observer) override;
  void removeObserver(platform::AppRegistryObserver& observer) override;
  /// A registry that cannot be read knows no app.
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

  // For install coordination: the same with requests that were checked.

  [[nodiscard]] Status installPackage(const platform::FileLocation& location, const InstallRequest& request);
  [[nodiscard]] Status recordPlaceholder(PendingContainer& container, const InstallRequest& request,
                                         StoredBundle bundle);
  /// Takes a placeholder's mark away; an unknown app fails.
  [[nodiscard]] Status removePlaceholder(std::string_view bundleIdentifier, const TransactionHook& transactionHook);
  [[nodiscard]] RunningInstalls& runningInstalls() noexcept { return *running_; }
  /// Whether what is left of a demoted app is on the home screen.
  [[nodiscard]] bool isDemoted(std::string_view bundleIdentifier) { return installer_.isDemoted(bundleIdentifier); }
  /// Begins the install of a demoted app, whose own placeholder stands for it.
  [[nodiscard]] Status beginReturn(std::string_view bundleIdentifier, const TransactionHook& transactionHook) {
    return installer_.beginReturn(bundleIdentifier, transactionHook);
  }

  /// `installApplication` for an app, or its placeholder, that is part of the system.
  [[nodiscard]] Status installSystemApplication(const platform::FileLocation& location,
                                                const plist::Dictionary& options);

  /// Makes an installed app a demoted one: its package goes, a placeholder of `type` stays with its icon, name,
  /// version, store metadata and licence, and its data stays. Fails for an app that is not installed, or is being
  /// updated.
  [[nodiscard]] Status demote(std::string_view bundleIdentifier, platform::TSInstallType type) {
    return installer_.demote(bundleIdentifier, type);
  }

  /// Says anew why there is a placeholder of an app that is not installed: a demoted app's install does not wait for a
  /// package, a restored app's does.
  [[nodiscard]] Status setPlaceholderType(std::string_view bundleIdentifier, platform::TSInstallType type) {
    return installer_.setPlaceholderType(bundleIdentifier, type);
  }

  /// Gives the placeholder of an app that is not installed another name on the home screen.
  [[nodiscard]] Status renamePlaceholder(std::string_view bundleIdentifier, std::string_view name) {
    return installer_.renamePlaceholder(bundleIdentifier, name);
  }

  /// A running install of the app comes before all others.
  void prioritizeInstall(std::string_view bundleIdentifier) { running_->prioritize(bundleIdentifier); }

  /// Why the app's latest install in this process failed; none when it succeeded or there was none.
  [[nodiscard]] std::optional<Error> lastInstallFailure(std::string_view bundleIdentifier);

  /// Every app, in the order of walks.
  [[nodiscard]] Result<std::vector<std::shared_ptr<const AppRecord>>> apps();

  /// Gives the app, and its placeholder, licence data in place of what they had. Fails for an unknown app.
  [[nodiscard]] Status setLicenceData(std::string_view bundleIdentifier, ByteView licence);

  /// The licence data that the app, or its placeholder, was installed with.
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
  /// Destroyed first: until then its thread asks `running_`.
  RegistryObservers observers_;
};

}  // namespace appsync::device
