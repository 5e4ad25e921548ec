// The coordinators of a device and the operations on them.
#pragma once

#include <chrono>
#include <condition_variable>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "base/OperationQueue.h"
#include "device/apps/AppRegistry.h"
#include "device/coordination/CoordinationError.h"
#include "device/coordination/CoordinatorObservers.h"
#include "device/coordination/CoordinatorState.h"
#include "device/coordination/CoordinatorTable.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"

namespace appsync::device {

/// States are kept in memory and written through to the database; CoordinatorState.h shows the stages and what each
/// operation stores. Nothing waits for the disk: after a power failure the last changes are lost and clients request
/// the packages again.
///
/// One lock guards all states. It is held during use of the database, the registry and the disk, never during
/// callbacks.
///
/// Handles share this object and may outlive the service; changes then fail. Thread-safe.
class Coordinators : public std::enable_shared_from_this<Coordinators> {
 public:
  static constexpr std::size_t kInstallsAtOnce = 10;

  using Coordinator = std::shared_ptr<CoordinatorState>;
  using CoordinatorList = std::vector<Coordinator>;
  using Configuration = std::function<Status(PlaceholderState& copy)>;
  using Completion = platform::InstallCoordination::UninstallCompletion;

  /// All arguments must outlive `end`.
  Coordinators(Database& database, DeviceFileSystem& files, AppRegistry& registry)
      : database_(database), files_(files), registry_(registry) {}

  /// Resumes the coordinators of an earlier process: shows their placeholders and installs the apps that are ready.
  void begin();
  /// Ends the service: finishes running installs and all removals; other installs wait for the next `begin`. Blocks
  /// until all threads of the service have ended. Must not be called on one of them.
  void end();

  /// Runs `read` with the lock held.
  template <class Read>
  [[nodiscard]] auto read(const Read& read) const {
    const std::lock_guard lock(mutex_);
    return read();
  }

  [[nodiscard]] Coordinator find(platform::CoordinatorKind kind, std::string_view identifier,
                                 platform::ClientIdentity client) const;
  [[nodiscard]] Result<Coordinator> findOrMake(platform::CoordinatorKind kind, std::string_view identifier,
                                               platform::ClientIdentity client, bool& isNew);
  /// Returns every coordinator, the oldest first.
  [[nodiscard]] CoordinatorList all() const;

  // Changes of a coordinator by `client`. A failure changes nothing.

  void setObserver(const Coordinator& coordinator, CoordinatorObservers::Observer observer);
  Status setOptions(const Coordinator& coordinator, platform::ClientIdentity client, CoordinatorOptions options);
  Status setInitialODRAssets(const Coordinator& coordinator, platform::ClientIdentity client,
                             std::vector<std::shared_ptr<PromiseState>> promises);
  Status setResponsibleClient(const Coordinator& coordinator, platform::ClientIdentity client,
                              platform::ClientIdentity responsible);
  /// Sets the app asset, which the responsible client may set too, or the user data.
  Status setPromise(const Coordinator& coordinator, platform::ClientIdentity client, PromiseRole role,
                    std::shared_ptr<PromiseState> promise);
  Status setPlaceholder(const Coordinator& coordinator, platform::ClientIdentity client,
                        const std::shared_ptr<PlaceholderState>& placeholder);
  Status cancel(const Coordinator& coordinator, const Error& reason, platform::ClientIdentity client);

  // Changes of promises.

  void setFraction(const std::shared_ptr<PromiseState>& promise, double fraction);
  void setTransferPath(const std::shared_ptr<PromiseState>& promise, const platform::FileLocation& path);
  void fulfil(const std::shared_ptr<PromiseState>& promise);
  Status withdraw(const std::shared_ptr<PromiseState>& promise, platform::ClientIdentity client);
  [[nodiscard]] std::string describe(const PromiseState& promise) const;

  // Changes of placeholders.

  /// Changes a placeholder whose configuration is not complete. A failure changes nothing.
  Status configure(const std::shared_ptr<PlaceholderState>& placeholder, const Configuration& change);
  Status withdraw(const std::shared_ptr<PlaceholderState>& placeholder, platform::ClientIdentity client);

  /// Cancels all coordinators of an app. Fails if there are none or one is installing.
  Status cancelAll(std::string_view identifier, const Error& reason, platform::ClientIdentity client);
  bool prioritize(std::string_view identifier);
  /// Removes an app on a thread of the service, which calls `completion`.
  void uninstall(std::string identifier, Completion completion);

  /// Blocks until all installs, removals and callbacks have ended. Returns false on time-out.
  [[nodiscard]] bool waitUntilIdle(std::chrono::steady_clock::time_point deadline);

  [[nodiscard]] CoordinatorObservers& observers() noexcept { return *observers_; }

 private:
  using Report = std::function<void(platform::InstallObserverDelegate&, platform::InstallCoordinator&)>;

  // With the lock held.

  [[nodiscard]] Status checkOpen() const;
  [[nodiscard]] static Status checkOpen(const PlaceholderState& placeholder);
  /// Checks that `client` may set a value of a coordinator that, if `wasSet`, was set before.
  [[nodiscard]] Status mayChange(const CoordinatorState& coordinator, platform::ClientIdentity client,
                                 bool wasSet) const;
  [[nodiscard]] Status store(const CoordinatorState& coordinator, const TransactionHook& store);
  [[nodiscard]] Status choose(const Coordinator& coordinator, CoordinatorChoices choices);
  [[nodiscard]] Status show(const PlaceholderState& placeholder, const TransactionHook& store);
  /// Returns whether the placeholder is for a demoted app, which keeps its own placeholder if the install fails.
  [[nodiscard]] bool reinstallsDemotedApp(const PlaceholderState& placeholder) const;
  /// Updates the progress of the placeholder's install from the app asset.
  void followPromise(const CoordinatorState& coordinator);
  /// Installs the app if all conditions are met.
  void advance(const Coordinator& coordinator);
  Status cancelNow(const Coordinator& coordinator, const Error& reason, platform::ClientIdentity client);
  /// Deletes the rows and removes the placeholder.
  [[nodiscard]] Status erase(const CoordinatorState& coordinator);
  /// Ends a coordinator whose rows were deleted.
  void close(const Coordinator& coordinator, std::optional<Error> error);
  [[nodiscard]] CoordinatorList ofApp(std::string_view identifier) const;
  [[nodiscard]] bool isInstalling(std::string_view identifier) const;
  /// Ends a coordinator that restores a demoted app once its placeholder is shown: no package is expected.
  void endIfDemoted(const Coordinator& coordinator);
  /// Shows the placeholder again if the registry has none.
  void ensurePlaceholderShown(const CoordinatorState& coordinator);
  void notify(const Coordinator& coordinator, Report report);

  // With or without the lock held.

  /// Deletes the package that the service owns, if any.
  void removePackage(const CoordinatorState& coordinator);

  // Without the lock held.

  void install(const Coordinator& coordinator);
  [[nodiscard]] std::optional<Error> uninstallNow(const std::string& identifier);
  void flushUnsavedPromises();

  Database& database_;
  DeviceFileSystem& files_;
  AppRegistry& registry_;
  const std::shared_ptr<CoordinatorObservers> observers_ = std::make_shared<CoordinatorObservers>();

  mutable std::mutex mutex_;
  /// Signalled when an install or removal has ended.
  std::condition_variable changed_;
  /// By app, the oldest first.
  std::map<std::string, CoordinatorList, std::less<>> coordinators_;
  std::size_t installing_ = 0;
  std::size_t removals_ = 0;
  bool isEnding_ = false;
  std::unique_ptr<OperationQueue> installs_ = std::make_unique<OperationQueue>(kInstallsAtOnce);
  /// Separate from installs, because a removal may wait for one.
  std::unique_ptr<OperationQueue> removalQueue_ = std::make_unique<OperationQueue>(1);
};

}  // namespace appsync::device
