// A sync that a test can stop at a known point and inspect.
#pragma once

#include <atomic>
#include <csignal>
#include <memory>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "device/Device.h"
#include "host/SyncReporter.h"
#include "kit/fakes/Gate.h"

namespace appsync::test {

/// Blocks the thread that reaches the named step of the device for the n-th time. At most one may exist at a time.
class StepHold {
 public:
  StepHold(std::string_view step, std::size_t time);
  /// Releases the thread.
  ~StepHold();
  StepHold(const StepHold&) = delete;
  StepHold& operator=(const StepHold&) = delete;

  void waitUntilHeld() { gate_.waitUntilStopped(1); }
  void letGo() { gate_.open(); }

 private:
  static int passStep(const char* name);

  const std::string step_;
  const std::size_t due_;
  std::atomic<std::size_t> times_ = 0;
  Gate gate_;
};

/// The report of a sync.
class RecordingReporter final : public host::SyncReporter {
 public:
  void progressed(const host::AppProgress& progress) override;
  void waits(const host::AppName&, std::string_view) override {}
  void interrupted() override {}
  void warned(std::string_view /*sentence*/) override {}
  void finished(const host::AppOutcome& outcome) override;
  void summarise(const host::AppOutcomes&) override {}

  std::vector<std::string> sent;   ///< apps in the order in which their packages were begun
  std::vector<std::string> ended;  ///< "installed org.a", "skipped org.b: reason"
  double overall = 0;
  bool wentBack = false;
};

/// `appsync sync` without its command line, on a thread of this process.
class SyncInThisProcess {
 public:
  SyncInThisProcess(const std::string& devicePath, const std::string& libraryPath);
  /// Waits for the end of the sync.
  ~SyncInThisProcess();
  SyncInThisProcess(const SyncInThisProcess&) = delete;
  SyncInThisProcess& operator=(const SyncInThisProcess&) = delete;

  [[nodiscard]] device::Services& services() { return device_->services(); }
  /// Blocks until all notifications are delivered. Must not be called while an install is held.
  void waitUntilTold();
  /// Releases a held thread, waits for the end of the sync, and closes the device.
  const RecordingReporter& finish();

 private:
  std::unique_ptr<device::Device> device_;
  RecordingReporter reporter_;
  std::thread thread_;
};

}  // namespace appsync::test
