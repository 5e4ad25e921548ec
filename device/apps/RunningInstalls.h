// The installs that are under way.
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

/// One install per app at most: from its placeholder, or its package's installation, to the end of the latter. Changes
/// of its course are stored at once, of units now and then, for other processes to see. Threads: any.
class RunningInstalls : public std::enable_shared_from_this<RunningInstalls> {
 public:
  /// Both must outlive every use.
  RunningInstalls(Database& database, RegistryObservers& observers) : database_(database), observers_(observers) {}

  /// Takes up the installs that an earlier process stored.
  void resume();

  /// Starts an install, or takes the running one to `values`. Observers are told of it with a record of `app`.
  std::shared_ptr<InstallProgress> begin(AppRow app, const ProgressValues& values);

  /// The app's running install, or null.
  [[nodiscard]] std::shared_ptr<InstallProgress> find(std::string_view identifier) const;

  /// Ends it, if one runs.
  void end(std::string_view identifier, platform::TSInstallState lastState);

  /// The install's phase is over: a failed or finished install ends, any other goes on to be installed.
  void phaseFinished(const platform::InstallProgress& progress);

  /// Runs before all others from now on.
  void prioritize(std::string_view identifier);

  /// By rank; what has failed, finished or been cancelled is in neither list.
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
