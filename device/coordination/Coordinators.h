// Every coordinator of a device, and what becomes of it.
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

/// What is known of coordinators is in memory and written through: it is in the database before a change returns, but
/// for how far a promise is and the path of one that is not complete, which are written when it completes or the
/// service ends. Nothing here waits for the disk: what a loss of power takes back is offered again.
///
/// One lock guards all states. With it held the database, the registry and the disk are used, never a client.
///
/// Handles share it and may outlive the service; all that would change something fails then. Threads: any.
class Coordinators : public std::enable_shared_from_this<Coordinators> {
 public:
  static constexpr std::size_t kInstallsAtOnce = 10;

  using Coordinator = std::shared_ptr<CoordinatorState>;
  using CoordinatorList = std::vector<Coordinator>;
  using Configuration = std::function<Status(PlaceholderState& copy)>;
  using Completion = platform::InstallCoordination::UninstallCompletion;

  /// All must live until `end` has returned.
  Coordinators(Database& database, DeviceFileSystem& files, AppRegistry& registry)
      : database_(database), files_(files), registry_(registry) {}

  /// Takes up the coordinators that an earlier process left: shows their placeholders, installs what is ready.
  void begin();
  /// Ends the service: what is being installed is finished, what is not yet waits for the next `begin`; removals are
  /// made. When it returns nothing of the service runs. Not on a thread of the service's.
  void end();

  /// Looks at states.
  template <class Read>
  [[nodiscard]] auto read(const Read& read) const {
    const std::lock_guard lock(mutex_);
    return read();
  }

  [[nodiscard]] Coordinator find(platform::CoordinatorKind kind, std::string_view identifier,
                                 platform::ClientIdentity client) const;
  [[nodiscard]] Result<Coordinator> findOrMake(platform::CoordinatorKind kind, std::string_view identifier,
                                               platform::ClientIdentity client, bool& isNew);
  /// The oldest first.
  [[nodiscard]] CoordinatorList all() const;

  // Changes of a coordinator by `client`, each all or nothing.

  void setObserver(const Coordinator& coordinator, CoordinatorObservers::Observer observer);
  Status setOptions(const Coordinator& coordinator, platform::ClientIdentity client, CoordinatorOptions options);
  Status setInitialODRAssets(const Coordinator& coordinator, platform::ClientIdentity client,
                             std::vector<std::shared_ptr<PromiseState>> promises);
  Status setResponsibleClient(const Coordinator& coordinator, platform::ClientIdentity client,
                              platform::ClientIdentity responsible);
  /// The app asset, which the responsible client may give too, or the user data.
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

  /// Makes a change to one that can still be configured. A failing change changes nothing.
  Status configure(const std::shared_ptr<PlaceholderState>& placeholder, const Configuration& change);
  Status withdraw(const std::shared_ptr<PlaceholderState>& placeholder, platform::ClientIdentity client);

  /// Cancels all coordinators of an app; fails when there are none, or one that installs.
  Status cancelAll(std::string_view identifier, const Error& reason, platform::ClientIdentity client);
  bool prioritize(std::string_view identifier);
  /// Removes an app on a thread of the service's.
  void uninstall(std::string identifier, Completion completion);

  /// False when, by then, something was still being installed, removed or told.
  [[nodiscard]] bool waitUntilIdle(std::chrono::steady_clock::time_point deadline);

  [[nodiscard]] CoordinatorObservers& observers() noexcept { return *observers_; }

 private:
  using Store = TransactionHook;
  using Report = std::function<void(platform::InstallObserverDelegate&, platform::InstallCoordinator&)>;

  // With the lock held.

  [[nodiscard]] Status checkOpen() const;
  [[nodiscard]] static Status checkOpen(const PlaceholderState& placeholder);
  /// Whether `client` may set something of a coordinator, that was set before or not.
  [[nodiscard]] Status mayChange(const CoordinatorState& coordinator, platform::ClientIdentity client,
                                 bool wasSet) const;
  [[nodiscard]] Status store(const CoordinatorState& coordinator, const Store& store);
  [[nodiscard]] Status choose(const Coordinator& coordinator, CoordinatorChoices choices);
  [[nodiscard]] Status show(const PlaceholderState& placeholder, const Store& store);
  /// Whether it is a demoted app's, whose own placeholder stays: it is what is left if the install comes to nothing.
  [[nodiscard]] bool reinstallsDemotedApp(const PlaceholderState& placeholder) const;
  void followPromise(const CoordinatorState& coordinator);
  /// Installs the app if all conditions are met.
  void advance(const Coordinator& coordinator);
  Status cancelNow(const Coordinator& coordinator, const Error& reason, platform::ClientIdentity client);
  /// Takes the rows and the placeholder away.
  [[nodiscard]] Status erase(const CoordinatorState& coordinator);
  /// Ends a coordinator whose rows have gone.
  void close(const Coordinator& coordinator, std::optional<Error> error);
  [[nodiscard]] CoordinatorList ofApp(std::string_view identifier) const;
  [[nodiscard]] bool isInstalling(std::string_view identifier) const;
  /// Ends one that restores a demoted app, once its placeholder is shown: nobody brings a package.
  void endIfDemoted(const Coordinator& coordinator);
  /// Shows the placeholder again if nothing does.
  void ensurePlaceholderShown(const CoordinatorState& coordinator);
  void tell(const Coordinator& coordinator, Report report);

  // With it or without.

  /// Removes the package that is the service's, if there is one.
  void removePackage(const CoordinatorState& coordinator);

  // Without it.

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
  /// Apart from installs, for which a removal may have to wait.
  std::unique_ptr<OperationQueue> removalQueue_ = std::make_unique<OperationQueue>(1);
};

}  // namespace appsync::device
