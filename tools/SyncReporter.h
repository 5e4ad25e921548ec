// Those who are told how a sync goes.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "tools/AppOutcome.h"
#include "tools/StandardOutput.h"

namespace appsync::tools {

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
  /// Exactly once for each app.
  virtual void finished(const AppOutcome& outcome) = 0;
  /// Once, at the end.
  virtual void summarise(const AppOutcomes& outcomes) = 0;
};

/// What people are told when they interrupt a sync.
inline constexpr std::string_view kInterruptedNotice =
    "interrupted; finishing what was sent already. Interrupt again to end at once";

/// Plain lines for pipes: one for each app with which something happened, and a last one that counts.
[[nodiscard]] std::unique_ptr<SyncReporter> makePlainReporter(StandardOutput& output);
/// The same lines, and below them, redrawn in place, one per running app and one for the whole.
[[nodiscard]] std::unique_ptr<SyncReporter> makeTerminalReporter(StandardOutput& output);
/// JSON Lines for machines.
[[nodiscard]] std::unique_ptr<SyncReporter> makeJsonReporter(StandardOutput& output, Course course);

}  // namespace appsync::tools
