// Watches the installs that the plug-in runs on threads of its own.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <list>
#include <mutex>
#include <string>
#include <thread>

#include "device/Device.h"
#include "tools/AppOutcome.h"
#include "tools/Interruption.h"
#include "tools/SyncProgress.h"

namespace appsync::tools {

/// A package that was handed over.
struct SentPackage {
  AppName app;
  AppEvent success = AppEvent::installed;  ///< what it is when it is in
  std::string path;                        ///< device path of the package file
  std::uint64_t bytes = 0;
};

/// The plug-in removes each package file once its install is over, well or not: that is how the host sees the end.
/// Tells `progress` how far each install is, that one waits for the home screen, and of each end. Threads: any.
class InstallWatcher {
 public:
  /// All must outlive it.
  InstallWatcher(device::Device& device, SyncProgress& progress, const Interruption& interruption);
  /// Ends the watch.
  ~InstallWatcher();
  InstallWatcher(const InstallWatcher&) = delete;
  InstallWatcher& operator=(const InstallWatcher&) = delete;

  /// To be called in front of the package's hand-over.
  void watch(SentPackage package);

  /// Blocks until another package of that size may lie on the device beside those whose install is not over, or the
  /// user interrupts: sending is faster than installing.
  void waitForRoom(std::uint64_t bytes);

  /// Looks once more at everything that is being watched. For the moment at which all installs are over.
  void lookAgain();

 private:
  struct Watched {
    SentPackage package;
    std::chrono::steady_clock::time_point since;
  };

  void run();
  void look(const std::unique_lock<std::mutex>& lock);
  [[nodiscard]] bool isOver(const Watched& watched);
  void showInstall(const Watched& watched);

  device::Device& device_;
  SyncProgress& progress_;
  const Interruption& interruption_;
  std::mutex mutex_;
  std::condition_variable changed_;
  // Under mutex_:
  std::list<Watched> watched_;
  std::uint64_t bytes_ = 0;
  bool ends_ = false;
  unsigned looks_ = 0;
  std::thread thread_;
};

/// What came of an app that was sent, as the device knows it.
[[nodiscard]] AppOutcome outcomeOnDevice(device::Device& device, const SentPackage& package);

}  // namespace appsync::tools
