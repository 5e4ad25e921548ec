// How far a sync is, from what its threads tell.
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

/// Turns reports on single apps into progress that never goes back and into exactly one outcome for each app, and
/// passes both on to the reporter, progress not more often than people and machines can use. Threads: any.
class SyncProgress {
 public:
  using Clock = std::chrono::steady_clock;

  /// `reporter` must outlive it.
  explicit SyncProgress(SyncReporter& reporter) : reporter_(reporter) {}

  /// An app that is to be sent; the whole weighs apps by the bytes of their packages.
  void expect(const AppName& app, std::uint64_t bytes);

  void sending(std::string_view identifier, double fraction);
  void installing(std::string_view identifier, double fraction);
  void waits(std::string_view identifier, std::string_view reason);

  /// The user asked for an end. May be told again and again.
  void interrupted();

  /// Something that the user should know and that is no app's end.
  void warn(std::string_view sentence);

  /// The app's end, or a package file's. Only the first one of a name counts; returns whether it was that.
  bool finish(const AppOutcome& outcome);
  /// The same for an app that is expected, named as it was then; does nothing for others.
  void finishExpected(std::string_view identifier, AppEvent event, std::string_view reason);

  /// Tells the reporter that it was all. The outcomes, in the order in which they came.
  const AppOutcomes& summarise();

 private:
  struct Running {
    AppName app;
    double weight = 0;
    double fraction = 0;
    double reported = -1;  // the fraction that the reporter knows
    AppStage stage = AppStage::sending;
    Clock::time_point reportedAt;
  };

  void advance(std::string_view identifier, AppStage stage, double fraction);
  void report(Running& running);
  void moveTo(Running& running, double fraction);

  SyncReporter& reporter_;
  std::mutex mutex_;
  // Under mutex_, as are the calls of the reporter:
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
