// The running installs.
#pragma once

#include <chrono>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include "device/apps/InstallProgress.h"
#include "device/apps/RegistryObservers.h"
#include "device/storage/Database.h"

namespace appsync::device {

/// At most one install per app, from its placeholder or the start of its package's installation to the end of the
/// latter. Changes of state and phase are stored at once for other processes, changes of units at intervals.
/// Thread-safe.
class RunningInstalls : public std::enable_shared_from_this<RunningInstalls> {
 public:
  /// Both arguments must outlive this object.
  RunningInstalls(Database& database, RegistryObservers& observers) : database_(database), observers_(observers) {}

  /// Resumes the installs that an earlier process stored.
  void resume();

  /// Starts an install, or sets the running one to `values`. Observers receive a record of `app`.
  std::shared_ptr<InstallProgress> begin(AppRow app, const ProgressValues& values);

  /// Returns the app's running install, or null.
  [[nodiscard]] std::shared_ptr<InstallProgress> find(std::string_view identifier) const;

  /// Ends the app's running install, if any.
  void end(std::string_view identifier, platform::TSInstallState lastState);

  /// Ends the current phase: a failed, finished or cancelled install ends, any other enters the phase Installing.
  void phaseFinished(const platform::InstallProgress& progress);

  /// Moves the app's install to the front of the order.
  void prioritize(std::string_view identifier);

  /// Returns the installs by rank, without those that have failed, finished or been cancelled.
  [[nodiscard]] InstallOrder order() const;

 private:
  struct Run {
    std::shared_ptr<InstallProgress> progress;
    std::shared_ptr<const platform::AppRecord> record;
    std::int64_t rank = 0;
    std::chrono::steady_clock::time_point storedAt;
  };
  using Runs = std::map<std::string, Run, std::less<>>;

  [[nodiscard]] InstallProgress::Listener listener();
  void changed(InstallProgress& progress, InstallProgress::Change change);
  void store(const InstallProgress& progress);

  Database& database_;
  RegistryObservers& observers_;
  mutable std::mutex mutex_;
  Runs runs_;
  std::int64_t lastRank_ = 0;
  std::int64_t firstRank_ = 0;
};

}  // namespace appsync::device
