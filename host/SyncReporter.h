// The interface through which a sync reports its progress.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "host/AppOutcome.h"

namespace appsync::host {

/// The operation that is reported.
enum class OperationKind : std::uint8_t { sync, restore };

enum class AppStage : std::uint8_t { sending, installing, waiting };

/// The progress of one app and of the whole sync. Fractions are from 0 to 1 and never decrease.
struct AppProgress {
  const AppName& name;
  AppStage stage = AppStage::sending;
  double fraction = 0;
  double overall = 0;
  std::size_t finishedApps = 0;
  std::size_t allApps = 0;
};

/// Not thread-safe: callers must serialise the calls.
class SyncReporter {
 public:
  virtual ~SyncReporter() = default;

  virtual void progressed(const AppProgress& progress) = 0;
  /// The app waits for an external event. Called once per wait.
  virtual void waits(const AppName& app, std::string_view reason) = 0;
  /// The user interrupted the sync, which is ending. Called at most once.
  virtual void interrupted() = 0;
  /// A problem that concerns no single app: a sentence.
  virtual void warned(std::string_view sentence) = 0;
  /// Called exactly once for each app.
  virtual void finished(const AppOutcome& outcome) = 0;
  /// Called once, at the end.
  virtual void summarise(const AppOutcomes& outcomes) = 0;
};

}  // namespace appsync::host
