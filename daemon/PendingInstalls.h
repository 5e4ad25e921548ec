// The packages on the device whose installs have not ended.
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

/// A package that was passed to the client.
struct PendingInstall {
  host::AppName name;
  host::AppEvent success = host::AppEvent::installed;  ///< the event to report on success
  std::string path;                                    ///< path of the package file on the device
  std::uint64_t bytes = 0;
  std::chrono::steady_clock::time_point since;  ///< when it was passed to the client
};

/// A list of packages in the order of arrival. Thread-safe.
class PendingInstalls {
 public:
  /// `progress` receives each outcome and must outlive this object.
  explicit PendingInstalls(host::SyncProgress& progress) : progress_(progress) {}

  void add(PendingInstall package);
  /// Removes every package for which `outcomeOf` returns an outcome and reports that outcome, before `waitForSpace`
  /// returns. Returns whether any package was removed.
  bool settle(const std::function<std::optional<host::AppOutcome>(const PendingInstall&)>& outcomeOf);
  /// Returns the first packages, at most `most`.
  [[nodiscard]] std::vector<PendingInstall> first(std::size_t most) const;

  /// Blocks until the list has space for a package of `bytes`, or the user interrupts. Limits the disk space of sent
  /// packages, because sending is faster than installing.
  void waitForSpace(std::uint64_t bytes, const host::InterruptSignals& interruption) const;

 private:
  host::SyncProgress& progress_;
  mutable std::mutex mutex_;
  mutable std::condition_variable settled_;
  // Guarded by mutex_:
  std::vector<PendingInstall> packages_;
  std::uint64_t bytes_ = 0;
};

}  // namespace appsync::daemon
