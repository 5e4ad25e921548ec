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
constexpr auto kTimeBetweenLooks = 100ms;
/// Installs and removals move as fast as the disk does. What has not moved for so long never will, and must not hold up
/// the end of the sync for good.
constexpr auto kLongestSilence = 5min;
/// The same for somebody who asked for an end.
constexpr auto kLongestSilenceOnceInterrupted = 10s;

/// What the service says of a coordinator's end.
struct Ending {
  bool isCancelled = false;
  std::optional<Error> error;
};

host::AppOutcome outcomeOf(const Ending& ending, const SentPackage& package) {
  if (ending.isCancelled) return {host::AppEvent::skipped, package.app, std::string(host::kCancelledOnDevice)};
  if (ending.error) return {host::AppEvent::failed, package.app, ending.error->text};
  return {package.success, package.app, {}};
}

host::AppOutcome lost(device::Device& device, const SentPackage& package) {
  host::AppOutcome outcome = outcomeOnDevice(device, package);
  if (!host::isSuccess(outcome.event)) {
    outcome.reason = "the device does not tell how its install ends; `appsync apps` shows whether it is there";
  }
  return outcome;
}

/// The service installs an app once its package is there, and tells its observers how each coordinator ends.
class CoordinatedInstallWatcher final : public InstallWatcher, private platform::InstallObserverDelegate {
 public:
  CoordinatedInstallWatcher(device::Device& device, host::SyncProgress& progress,
                            const host::Interruption& interruption)
      : device_(device),
        progress_(progress),
        interruption_(interruption),
        packages_(progress),
        observer_(device.platform().installCoordination().initWithMachServiceName(
            kServiceName, {ClientIdentity::CXClientSync}, *this)) {}

  void watch(SentPackage package) override {
    const std::lock_guard lock(mutex_);
    const auto ending = early_.find(package.app.identifier);
    if (ending == early_.end()) return packages_.add(std::move(package));
    progress_.finish(outcomeOf(ending->second, package));
  }

  void waitForRoom(std::uint64_t bytes) override { packages_.waitForRoom(bytes, interruption_); }

  void waitForOthers() override {
    waitUntilIdle();
    const std::lock_guard lock(mutex_);
    early_.clear();  // how an earlier sync's installs ended
  }

  void waitForInstalls() override {
    waitUntilIdle();
    // Of what is left the service will say no more.
    packages_.settle([&](const SentPackage& package) { return lost(device_, package); });
  }

 private:
  using Clock = std::chrono::steady_clock;

  void coordinatorDidCompleteSuccessfully(InstallCoordinator& coordinator) override {
    ended(coordinator, {false, coordinator.coordinatorError()});
  }

  /// Whoever else cancels, the plug-in treats it as the wish of the person who holds the device.
  void coordinatorCanceledWithReason(InstallCoordinator& coordinator, const Error& reason,
                                     ClientIdentity client) override {
    ended(coordinator, {client != ClientIdentity::CXClientSync, reason});
  }

  void ended(const InstallCoordinator& coordinator, const Ending& ending) {
    const std::string identifier = coordinator.bundleID().value_or("");
    const std::lock_guard lock(mutex_);
    hasNews();
    const bool wasSent = packages_.settle([&](const SentPackage& package) -> std::optional<host::AppOutcome> {
      if (package.app.identifier != identifier) return std::nullopt;
      return outcomeOf(ending, package);
    });
    if (wasSent) return;
    early_.insert_or_assign(identifier, ending);
    if (ending.isCancelled) progress_.finishExpected(identifier, host::AppEvent::skipped, host::kCancelledOnDevice);
  }

  void look() {
    if (interruption_.requested()) progress_.interrupted();
    double sum = 0;
    for (const SentPackage& package : packages_.first(kShownInstalls))
      sum += showInstall(device_, package.app.identifier, progress_);
    if (std::exchange(shown_, sum) != sum) hasNews();
  }

  /// Until the service has done, and told everybody, all that it can.
  void waitUntilIdle() {
    hasNews();
    while (!device_.services().installCoordination().waitUntilIdle(kTimeBetweenLooks)) {
      const auto longest = interruption_.requested() ? kLongestSilenceOnceInterrupted : kLongestSilence;
      if (Clock::now() - lastNews_.load() >= longest) return;
    }
  }

  void hasNews() { lastNews_ = Clock::now(); }

  device::Device& device_;
  host::SyncProgress& progress_;
  const host::Interruption& interruption_;
  SentPackages packages_;
  std::mutex mutex_;
  std::map<std::string, Ending, std::less<>> early_;  // under mutex_: of apps whose packages were not handed over yet
  std::atomic<Clock::time_point> lastNews_{Clock::now()};
  double shown_ = 0;  // the ticker's own
  const std::unique_ptr<platform::InstallObserver> observer_;
  host::Ticker ticker_{kTimeBetweenLooks, [this] { look(); }};
};

}  // namespace

std::unique_ptr<InstallWatcher> makeCoordinatedInstallWatcher(device::Device& device, host::SyncProgress& progress,
                                                              const host::Interruption& interruption) {
  return std::make_unique<CoordinatedInstallWatcher>(device, progress, interruption);
}

}  // namespace appsync::daemon
