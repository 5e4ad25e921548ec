#include <atomic>
#include <chrono>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <utility>

#include "daemon/InstallWatcher.h"
#include "daemon/InstallsOnDevice.h"
#include "host/Ticker.h"
#include "platform/InstallCoordination.h"

namespace appsync::daemon {
namespace {

using namespace std::chrono_literals;
using platform::ClientIdentity;
using platform::InstallCoordinator;

constexpr std::string_view kServiceName = "com.corvel.appsync.sync";
/// Progress requires registry look-ups, and the service notifies of everything else.
constexpr auto kTimeBetweenProgress = 5 * host::kTimeBetweenLooks;
/// The watcher waits no longer for installs and removals without any progress: they must not block the sync forever.
constexpr auto kStallTimeout = 5min;
constexpr auto kStallTimeoutOnceInterrupted = 10s;

/// How a coordinator ended.
struct Ending {
  bool isCancelled = false;
  std::optional<Error> error;
};

host::AppOutcome outcomeOf(const Ending& ending, const PendingInstall& package) {
  if (ending.isCancelled) return {host::AppEvent::skipped, package.name, std::string(host::kCancelledOnDevice)};
  if (ending.error) return {host::AppEvent::failed, package.name, ending.error->text};
  return {package.success, package.name, {}};
}

host::AppOutcome outcomeWithoutNotification(device::Device& device, const PendingInstall& package) {
  host::AppOutcome outcome = outcomeOnDevice(device, package);
  if (!host::isSuccess(outcome.event)) {
    outcome.reason = "the device did not report the end of its install; see `appsync apps`";
  }
  return outcome;
}

/// The service installs an app when its package is complete, and notifies its observers of each coordinator's end.
class CoordinatedInstallWatcher final : public InstallWatcher, private platform::InstallObserverDelegate {
 public:
  CoordinatedInstallWatcher(device::Device& device, host::SyncProgress& progress,
                            const host::InterruptSignals& interruption)
      : device_(device),
        progress_(progress),
        interruption_(interruption),
        packages_(progress),
        observer_(device.platform().installCoordination().initWithMachServiceName(
            kServiceName, {ClientIdentity::CXClientSync}, *this)) {}

  void watch(PendingInstall package) override {
    const std::lock_guard lock(mutex_);
    const auto ending = endedBeforeSent_.find(package.name.identifier);
    if (ending == endedBeforeSent_.end()) return packages_.add(std::move(package));
    progress_.finish(outcomeOf(ending->second, package));
  }

  void waitForSpace(std::uint64_t bytes) override { packages_.waitForSpace(bytes, interruption_); }

  void waitForOthers() override {
    waitUntilIdle();
    const std::lock_guard lock(mutex_);
    endedBeforeSent_.clear();  // installs of an earlier sync
  }

  void waitForInstalls() override {
    waitUntilIdle();
    // The service will not notify of the remaining ones.
    packages_.settle([&](const PendingInstall& package) { return outcomeWithoutNotification(device_, package); });
  }

 private:
  using Clock = std::chrono::steady_clock;

  void coordinatorDidCompleteSuccessfully(InstallCoordinator& coordinator) override {
    ended(coordinator, {false, coordinator.coordinatorError()});
  }

  /// The plug-in treats a cancellation by any other client as the user's.
  void coordinatorCanceledWithReason(InstallCoordinator& coordinator, const Error& reason,
                                     ClientIdentity client) override {
    ended(coordinator, {client != ClientIdentity::CXClientSync, reason});
  }

  void ended(const InstallCoordinator& coordinator, const Ending& ending) {
    const std::string identifier = coordinator.bundleID().value_or("");
    const std::lock_guard lock(mutex_);
    resetStallTimer();
    const bool wasSent = packages_.settle([&](const PendingInstall& package) -> std::optional<host::AppOutcome> {
      if (package.name.identifier != identifier) return std::nullopt;
      return outcomeOf(ending, package);
    });
    if (wasSent) return;
    endedBeforeSent_.insert_or_assign(identifier, ending);
    if (ending.isCancelled) progress_.finishExpected(identifier, host::AppEvent::skipped, host::kCancelledOnDevice);
  }

  void look() {
    if (interruption_.requested()) progress_.interrupted();
    double sum = 0;
    for (const PendingInstall& package : packages_.first(kShownInstalls))
      sum += showInstall(device_, package.name.identifier, progress_);
    if (std::exchange(shown_, sum) != sum) resetStallTimer();
  }

  /// Blocks until the service has no work and no notifications left, or has made no progress for the time-out.
  void waitUntilIdle() {
    resetStallTimer();
    while (!device_.services().installCoordination().waitUntilIdle(kTimeBetweenProgress)) {
      const auto timeout = interruption_.requested() ? kStallTimeoutOnceInterrupted : kStallTimeout;
      if (Clock::now() - lastProgress_.load() >= timeout) return;
    }
  }

  void resetStallTimer() { lastProgress_ = Clock::now(); }

  device::Device& device_;
  host::SyncProgress& progress_;
  const host::InterruptSignals& interruption_;
  PendingInstalls packages_;
  std::mutex mutex_;
  std::map<std::string, Ending, std::less<>>
      endedBeforeSent_;  // guarded by mutex_; apps whose packages were not sent yet
  std::atomic<Clock::time_point> lastProgress_{Clock::now()};
  double shown_ = 0;  // used on the ticker's thread only
  const std::unique_ptr<platform::InstallObserver> observer_;
  host::Ticker ticker_{kTimeBetweenProgress, [this] { look(); }};
};

}  // namespace

std::unique_ptr<InstallWatcher> makeCoordinatedInstallWatcher(device::Device& device, host::SyncProgress& progress,
                                                              const host::InterruptSignals& interruption) {
  return std::make_unique<CoordinatedInstallWatcher>(device, progress, interruption);
}

}  // namespace appsync::daemon
