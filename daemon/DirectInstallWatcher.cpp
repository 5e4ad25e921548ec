#include <chrono>
#include <optional>
#include <utility>

#include "daemon/InstallWatcher.h"
#include "daemon/InstallsOnDevice.h"
#include "host/Ticker.h"

namespace appsync::daemon {
namespace {

using namespace std::chrono_literals;

/// An install's progress requires a registry look-up, so it is polled less often.
constexpr unsigned kLooksBetweenProgress = 10;
/// An install that takes longer may be waiting for the home screen.
constexpr auto kSurelyStarted = 1s;

/// The plug-in runs the installs on its own threads and removes each package file after its install, successful or not.
/// The host detects the end of an install by the missing file.
class DirectInstallWatcher final : public InstallWatcher {
 public:
  DirectInstallWatcher(device::Device& device, host::SyncProgress& progress, const host::InterruptSignals& interruption)
      : device_(device), progress_(progress), interruption_(interruption), packages_(progress) {}

  void watch(PendingInstall package) override { packages_.add(std::move(package)); }
  void waitForSpace(std::uint64_t bytes) override { packages_.waitForSpace(bytes, interruption_); }
  /// Does nothing: the plug-in removes apps synchronously.
  void waitForOthers() override {}
  /// The client has already waited for all installs.
  void waitForInstalls() override { settle(); }

 private:
  void look() {
    if (interruption_.requested()) end();
    settle();
    if (++looks_ % kLooksBetweenProgress != 0) return;
    for (const PendingInstall& package : packages_.first(kShownInstalls)) {
      if (!showsWait(package)) showInstall(device_, package.name.identifier, progress_);
    }
  }

  /// Ends the unlimited retries of denied installs. They are dropped, not failed: their packages are valid, and the
  /// next sync sends them again.
  void end() {
    progress_.interrupted();
    device_.services().scheduler().close();
  }

  void settle() {
    packages_.settle([&](const PendingInstall& package) -> std::optional<host::AppOutcome> {
      if (device_.platform().fileSystem().fileExists(package.path)) return std::nullopt;
      return outcomeOnDevice(device_, package);
    });
  }

  bool showsWait(const PendingInstall& package) {
    const std::string& identifier = package.name.identifier;
    if (std::chrono::steady_clock::now() - package.since <= kSurelyStarted) return false;
    if (device_.services().settings().assertionAnswer(identifier) != device::AssertionAnswer::denied) return false;
    progress_.waits(identifier, "the home screen does not release it; the sync retries every 30 seconds");
    return true;
  }

  device::Device& device_;
  host::SyncProgress& progress_;
  const host::InterruptSignals& interruption_;
  PendingInstalls packages_;
  unsigned looks_ = 0;  // used on the ticker's thread only
  host::Ticker ticker_{host::kTimeBetweenLooks, [this] { look(); }};
};

}  // namespace

std::unique_ptr<InstallWatcher> makeDirectInstallWatcher(device::Device& device, host::SyncProgress& progress,
                                                         const host::InterruptSignals& interruption) {
  return std::make_unique<DirectInstallWatcher>(device, progress, interruption);
}

}  // namespace appsync::daemon
