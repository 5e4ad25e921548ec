// The progress of a sync, collected from its threads.
#pragma once

#include <chrono>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <utility>

#include "host/AppOutcome.h"
#include "host/SyncReporter.h"

namespace appsync::host {

/// Combines the progress of single apps into one fraction that never decreases, ensures exactly one outcome for each
/// app, and passes both to the reporter, progress at a limited rate. Thread-safe.
class SyncProgress {
 public:
  using Clock = std::chrono::steady_clock;

  /// `reporter` must outlive it.
  explicit SyncProgress(SyncReporter& reporter) : reporter_(reporter) {}

  /// Adds an app that will be sent. Apps are weighted by the size of their packages, `bytes`.
  void expect(const AppName& app, std::uint64_t bytes);

  void sending(std::string_view identifier, double fraction);
  void installing(std::string_view identifier, double fraction);
  void waits(std::string_view identifier, std::string_view reason);

  /// Reports that the user interrupted the sync. Idempotent.
  void interrupted();

  /// Reports a problem that concerns no single app.
  void warn(std::string_view sentence);

  /// Reports the outcome of an app or a package file. Returns false and does nothing if it already has an outcome.
  bool finish(const AppOutcome& outcome);
  /// Reports the outcome of an app that was added by `expect` and has none yet. Does nothing for other apps.
  void finishExpected(std::string_view identifier, AppEvent event, std::string_view reason);

  /// Has the reporter summarise the sync. Returns the outcomes in the order of arrival.
  const AppOutcomes& summarise();

 private:
  struct Running {
    AppName name;
    double weight = 0;
    double fraction = 0;
    double reported = -1;  // the fraction last passed to the reporter
    AppStage stage = AppStage::sending;
    Clock::time_point reportedAt;
  };

  void advance(std::string_view identifier, AppStage stage, double fraction);
  void report(Running& running);
  void moveTo(Running& running, double fraction);

  SyncReporter& reporter_;
  std::mutex mutex_;
  // Guarded by mutex_, as are the calls of the reporter:
  std::map<std::string, Running, std::less<>> running_;
  std::set<std::pair<NameKind, std::string>> finished_;
  AppOutcomes outcomes_;
  double weight_ = 0;
  double done_ = 0;
  double overall_ = 0;
  bool wasInterrupted_ = false;
  std::size_t expected_ = 0;
  std::size_t arrived_ = 0;
};

}  // namespace appsync::host
