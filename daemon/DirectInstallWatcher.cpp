#include <chrono>
#include <optional>
#include <utility>

#include "daemon/InstallWatcher.h"
#include "daemon/InstallsOnDevice.h"
#include "host/Ticker.h"

namespace appsync::daemon {
namespace {

using namespace std::chrono_literals;

constexpr auto kTimeBetweenLooks = 20ms;
/// An install's own progress costs a look-up in the registry, so only every so many looks.
constexpr unsigned kLooksBetweenProgress = 10;
/// An install that takes longer may be waiting for the home screen.
constexpr auto kSurelyStarted = 1s;

/// The plug-in runs the installs on threads of its own. It removes each package file once its install is over, well or
/// not: that is how the host sees the end.
class DirectInstallWatcher final : public InstallWatcher {
 public:
  DirectInstallWatcher(device::Device& device, host::SyncProgress& progress, const host::Interruption& interruption)
      : device_(device), progress_(progress), interruption_(interruption), packages_(progress) {}

  void watch(SentPackage package) override { packages_.add(std::move(package)); }
  void waitForRoom(std::uint64_t bytes) override { packages_.waitForRoom(bytes, interruption_); }
  /// Nothing does: the plug-in removes apps before it returns.
  void waitForOthers() override {}
  /// The client has waited for all installs already.
  void waitForInstalls() override { settle(); }

 private:
  void look() {
    if (interruption_.requested()) end();
    settle();
    if (++looks_ % kLooksBetweenProgress != 0) return;
    for (const SentPackage& package : packages_.first(kShownInstalls)) {
      if (!showsWait(package)) showInstall(device_, package.app.identifier, progress_);
    }
  }

  /// Ends the retries of denied installs, which have no limit. The installs are dropped and not failed: nothing is
  /// wrong with their packages, and the next sync sends them again.
  void end() {
    progress_.interrupted();
    device_.services().scheduler().close();
  }

  void settle() {
    packages_.settle([&](const SentPackage& package) -> std::optional<host::AppOutcome> {
      if (device_.platform().fileSystem().fileExists(package.path)) return std::nullopt;
      return outcomeOnDevice(device_, package);
    });
  }

  bool showsWait(const SentPackage& package) {
    const std::string& identifier = package.app.identifier;
    if (std::chrono::steady_clock::now() - package.since <= kSurelyStarted) return false;
    if (device_.services().settings().assertionAnswer(identifier) != device::AssertionAnswer::denied) return false;
    progress_.waits(identifier, "the home screen does not let go of it now; tried again every 30 seconds");
    return true;
  }

  device::Device& device_;
  host::SyncProgress& progress_;
  const host::Interruption& interruption_;
  SentPackages packages_;
  unsigned looks_ = 0;  // the ticker's own
  host::Ticker ticker_{kTimeBetweenLooks, [this] { look(); }};
};

}  // namespace

std::unique_ptr<InstallWatcher> makeDirectInstallWatcher(device::Device& device, host::SyncProgress& progress,
                                                         const host::Interruption& interruption) {
  return std::make_unique<DirectInstallWatcher>(device, progress, interruption);
}

}  // namespace appsync::daemon
