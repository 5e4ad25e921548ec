// Those who are told how a sync goes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "host/AppOutcome.h"

namespace appsync::host {

/// What is reported on.
enum class Course : std::uint8_t { sync, restore };

enum class AppStage : std::uint8_t { sending, installing, waiting };

/// How far one app is, and the whole sync. Fractions run from 0 to 1 and never go back.
struct AppProgress {
  const AppName& app;
  AppStage stage = AppStage::sending;
  double fraction = 0;
  double overall = 0;
  std::size_t finishedApps = 0;
  std::size_t allApps = 0;
};

/// Threads: one call at a time.
class SyncReporter {
 public:
  virtual ~SyncReporter() = default;

  virtual void progressed(const AppProgress& progress) = 0;
  /// The app waits for something outside; told once per wait.
  virtual void waits(const AppName& app, std::string_view reason) = 0;
  /// The user asked for an end, and the sync is on its way there. Once.
  virtual void interrupted() = 0;
  /// Something that the user should know and that is no app's end: a sentence.
  virtual void warned(std::string_view sentence) = 0;
  /// Exactly once for each app.
  virtual void finished(const AppOutcome& outcome) = 0;
  /// Once, at the end.
  virtual void summarise(const AppOutcomes& outcomes) = 0;
};

}  // namespace appsync::host
