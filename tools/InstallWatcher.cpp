#include "tools/InstallWatcher.h"

#include <algorithm>
#include <utility>

namespace appsync::tools {
namespace {

using namespace std::chrono_literals;
using platform::PlaceholderLookup;

constexpr auto kTimeBetweenLooks = 20ms;
/// An install's own progress costs a look-up in the registry, so only every so many looks.
constexpr unsigned kLooksBetweenProgress = 10;
/// Installs that run side by side; those behind them wait for their turn.
constexpr std::size_t kRunningInstalls = 10;
/// An install that takes longer may be waiting for the home screen.
constexpr auto kSurelyStarted = 1s;
constexpr std::size_t kMostPackages = 64;
constexpr std::uint64_t kMostBytes = std::uint64_t{256} << 20;

}  // namespace

InstallWatcher::InstallWatcher(device::Device& device, SyncProgress& progress, const Interruption& interruption)
    : device_(device), progress_(progress), interruption_(interruption), thread_([this] { run(); }) {}

InstallWatcher::~InstallWatcher() {
  {
    const std::lock_guard lock(mutex_);
    ends_ = true;
  }
  changed_.notify_all();
  thread_.join();
}

void InstallWatcher::watch(SentPackage package) {
  const std::lock_guard lock(mutex_);
  bytes_ += package.bytes;
  watched_.push_back({std::move(package), std::chrono::steady_clock::now()});
}

void InstallWatcher::waitForRoom(std::uint64_t bytes) {
  std::unique_lock lock(mutex_);
  const auto hasRoom = [&] {
    return watched_.empty() || (watched_.size() < kMostPackages && bytes_ + bytes <= kMostBytes);
  };
  while (!hasRoom() && !interruption_.requested())
    changed_.wait_for(lock, kTimeBetweenLooks, hasRoom);
}

void InstallWatcher::lookAgain() {
  const std::unique_lock lock(mutex_);
  look(lock);
}

void InstallWatcher::run() {
  std::unique_lock lock(mutex_);
  while (!ends_) {
    look(lock);
    changed_.wait_for(lock, kTimeBetweenLooks, [&] { return ends_; });
  }
}

void InstallWatcher::look(const std::unique_lock<std::mutex>& /*held*/) {
  if (interruption_.requested()) progress_.interrupted();
  const std::size_t before = watched_.size();
  std::erase_if(watched_, [&](const Watched& watched) {
    if (!isOver(watched)) return false;
    bytes_ -= watched.package.bytes;
    progress_.finish(outcomeOnDevice(device_, watched.package));
    return true;
  });
  if (watched_.size() < before) changed_.notify_all();
  if (++looks_ % kLooksBetweenProgress != 0) return;
  std::size_t shown = 0;
  for (const Watched& watched : watched_) {
    if (shown++ == kRunningInstalls) break;
    showInstall(watched);
  }
}

bool InstallWatcher::isOver(const Watched& watched) {
  return !device_.platform().fileSystem().fileExists(watched.package.path);
}

void InstallWatcher::showInstall(const Watched& watched) {
  const std::string& identifier = watched.package.app.identifier;
  if (std::chrono::steady_clock::now() - watched.since > kSurelyStarted &&
      device_.services().settings().assertionAnswer(identifier) == device::AssertionAnswer::denied) {
    progress_.waits(identifier, "the home screen does not let go of it now; tried again every 30 seconds");
    return;
  }
  platform::AppRegistry& registry = device_.platform().defaultRegistry();
  const auto record = registry.recordForIdentifier(identifier, PlaceholderLookup::on);
  const auto install =
      record ? registry.installProgressForApplication(*record, platform::TSInstallPhase::Installing) : nullptr;
  if (!install || install->totalUnitCount() <= 0) return;
  const double fraction =
      static_cast<double>(install->completedUnitCount()) / static_cast<double>(install->totalUnitCount());
  progress_.installing(identifier, std::clamp(fraction, 0.0, 1.0));
}

AppOutcome outcomeOnDevice(device::Device& device, const SentPackage& package) {
  platform::AppRegistry& registry = device.platform().defaultRegistry();
  const auto record = registry.recordForIdentifier(package.app.identifier, PlaceholderLookup::on);
  if (record && record->isInstalled() && !record->isPlaceholder()) return {package.success, package.app, {}};
  const auto failure = device.services().defaultRegistry().lastInstallFailure(package.app.identifier);
  return {AppEvent::failed, package.app, failure ? failure->text : "the device did not install it"};
}

}  // namespace appsync::tools
