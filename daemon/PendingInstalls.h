// The packages that lie on the device until their installs are over.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "host/AppOutcome.h"
#include "host/InterruptSignals.h"
#include "host/SyncProgress.h"

namespace appsync::daemon {

/// A package that was handed over.
struct SentPackage {
  host::AppName app;
  host::AppEvent success = host::AppEvent::installed;  ///< what it is when it is in
  std::string path;                                    ///< device path of the package file
  std::uint64_t bytes = 0;
  std::chrono::steady_clock::time_point since;  ///< when it was handed over
};

/// In the order in which they came. Threads: any.
class SentPackages {
 public:
  /// `progress`, which must outlive it, is told of each end.
  explicit SentPackages(host::SyncProgress& progress) : progress_(progress) {}

  void add(SentPackage package);
  /// What has an outcome is over, and told before anybody who waits for it here goes on. Returns whether any was.
  bool settle(const std::function<std::optional<host::AppOutcome>(const SentPackage&)>& outcomeOf);
  /// The first few.
  [[nodiscard]] std::vector<SentPackage> first(std::size_t most) const;

  /// Blocks until another package of that size may lie beside them, or the user interrupts: sending is faster than
  /// installing.
  void waitForRoom(std::uint64_t bytes, const host::Interruption& interruption) const;

 private:
  host::SyncProgress& progress_;
  mutable std::mutex mutex_;
  mutable std::condition_variable settled_;
  // Under mutex_:
  std::vector<SentPackage> packages_;
  std::uint64_t bytes_ = 0;
};

}  // namespace appsync::daemon
