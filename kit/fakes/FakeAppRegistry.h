// The app registry and its installer.
#pragma once

#include <cstddef>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FailurePlan.h"
#include "kit/fakes/FakeApp.h"
#include "kit/fakes/FakeCallbackThread.h"
#include "kit/fakes/FakeFileSystem.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/FakeUninstalledAppsList.h"
#include "kit/fakes/Gate.h"
#include "platform/AppRegistry.h"

namespace appsync::test {

enum class RegistryOperation { installApplication, uninstallApplication };

/// Stores apps in the order of their identifiers. Calls observers on a separate thread.
///
/// A package is any file that is not empty. If it is a property list with "BundleIdentifier" and "BundleVersion", these
/// apply, see `packageOf` in FakePackages.h; for a placeholder's directory, its "Info.plist" applies. Journal lines:
/// "registry.installApplication com.a /path", "registry.installPhaseFinishedForProgress com.a",
/// "registry.recordForIdentifier com.a", "progress.setInstallState 1 com.a" and so on. Fails the test if it is
/// destroyed while an observer is registered, or receives a progress of another registry.
class FakeAppRegistry final : public platform::AppRegistry {
 public:
  struct Install {
    std::string identifier;
    platform::FileLocation location;
    plist::Dictionary options;
  };
  struct Uninstall {
    std::string identifier;
    plist::Dictionary options;
    bool operator==(const Uninstall&) const = default;
  };

  FakeAppRegistry(CallJournal& journal, FakeFileSystem& files, FakeUninstalledAppsList& uninstalledApps);
  ~FakeAppRegistry() override;
  FakeAppRegistry(const FakeAppRegistry&) = delete;
  FakeAppRegistry& operator=(const FakeAppRegistry&) = delete;

  // Contents.
  void add(FakeApp app);
  /// Adds a bundle that is not an app, visited by enumerations of `kind` and of all. Identifiers may be equal.
  void addBundle(std::string identifier, platform::BundleKind kind);
  /// Returns the current state of the app.
  [[nodiscard]] std::optional<FakeApp> app(std::string_view identifier) const;
  [[nodiscard]] std::vector<std::string> identifiers() const;

  /// Failures of installs and uninstalls, by identifier.
  FailurePlan<RegistryOperation> failures;

  // For other services of the device: not journaled, otherwise like the corresponding call.
  [[nodiscard]] Status install(const platform::FileLocation& location, const plist::Dictionary& options);
  void showPlaceholder(const std::string& identifier, platform::TSInstallType type);
  void removePlaceholder(std::string_view identifier);
  [[nodiscard]] Status uninstall(std::string_view identifier, const plist::Dictionary& options = {});

  // Calls.
  [[nodiscard]] std::vector<Install> installs() const;
  [[nodiscard]] std::vector<Uninstall> uninstalls() const;
  [[nodiscard]] std::size_t mostInstallsAtOnce() const;

  /// Stops each install before it begins.
  Gate installGate;
  /// Stops before each callback to an observer; a stopped callback counts as running.
  Gate reportGate;

  /// Sets the prioritized and the paused installs, in order, and notifies observers.
  void setInstallOrder(std::vector<std::string> prioritized, std::vector<std::string> paused = {});
  /// Blocks until all pending callbacks have returned.
  void waitUntilReported() { reports_.waitUntilIdle(); }
  [[nodiscard]] std::size_t observerCount() const { return reports_.subscriptions(); }

  void addObserver(platform::AppRegistryObserver& observer) override;
  void removeObserver(platform::AppRegistryObserver& observer) override;
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

 private:
  using Subscription = FakeCallbackThread::Subscription;
  using Report = std::function<void(platform::AppRegistryObserver&)>;
  using Apps = std::map<std::string, FakeApp, std::less<>>;
  struct OtherBundle {
    std::string identifier;
    platform::BundleKind kind;
  };

  /// Must be called without the lock, to avoid a deadlock with the lock that a progress holds during a call.
  void attach(const std::string& identifier, const std::shared_ptr<FakeInstallProgress>& progress);
  void reportCancellation(const std::string& identifier);
  [[nodiscard]] platform::AppRecords recordsOf(const std::vector<std::string>& identifiers) const;
  [[nodiscard]] Report orderReport() const;
  void post(Subscription subscription, platform::AppRegistryObserver& observer, Report report);
  void postToAll(const Report& report);
  void dropPlaceholder(Apps::iterator entry);
  void apply(const std::string& identifier, const FakePackage& package, const plist::Dictionary& options);

  CallJournal& journal_;
  FakeFileSystem& files_;
  FakeUninstalledAppsList& uninstalledApps_;
  mutable std::mutex mutex_;
  Apps apps_;
  std::vector<OtherBundle> otherBundles_;
  std::vector<std::string> prioritized_;
  std::vector<std::string> paused_;
  std::map<platform::AppRegistryObserver*, Subscription> observers_;
  std::set<std::shared_ptr<FakeInstallProgress>> attached_;
  std::vector<Install> installs_;
  std::vector<Uninstall> uninstalls_;
  std::size_t running_ = 0;
  std::size_t mostAtOnce_ = 0;
  FakeCallbackThread reports_;
};

}  // namespace appsync::test
