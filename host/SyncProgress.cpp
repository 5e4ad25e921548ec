#include "host/SyncProgress.h"

#include <algorithm>
#include <utility>

namespace appsync::host {
namespace {

/// Weight of an app in addition to its bytes: the work that does not depend on its size, such as its placeholder.
constexpr double kFixedWeight = 100'000;
/// The transfer's share of an app's progress.
constexpr double kSendingShare = 0.5;
constexpr double kSmallestStep = 0.01;
constexpr auto kShortestTimeBetweenReports = std::chrono::milliseconds(50);

}  // namespace

void SyncProgress::expect(const AppName& app, std::uint64_t bytes) {
  const std::lock_guard lock(mutex_);
  if (finished_.contains({app.kind, app.identifier})) return;
  const auto [place, isNew] = running_.try_emplace(app.identifier);
  if (!isNew) return;
  place->second.name = app;
  place->second.weight = kFixedWeight + static_cast<double>(bytes);
  weight_ += place->second.weight;
  ++expected_;
}

void SyncProgress::sending(std::string_view identifier, double fraction) {
  advance(identifier, AppStage::sending, kSendingShare * fraction);
}

void SyncProgress::installing(std::string_view identifier, double fraction) {
  advance(identifier, AppStage::installing, kSendingShare + (1 - kSendingShare) * fraction);
}

void SyncProgress::waits(std::string_view identifier, std::string_view reason) {
  const std::lock_guard lock(mutex_);
  const auto found = running_.find(identifier);
  if (found == running_.end() || found->second.stage == AppStage::waiting) return;
  found->second.stage = AppStage::waiting;
  reporter_.waits(found->second.name, reason);
  report(found->second);
}

void SyncProgress::warn(std::string_view sentence) {
  const std::lock_guard lock(mutex_);
  reporter_.warned(sentence);
}

void SyncProgress::interrupted() {
  const std::lock_guard lock(mutex_);
  if (!std::exchange(wasInterrupted_, true)) reporter_.interrupted();
}

bool SyncProgress::finish(const AppOutcome& outcome) {
  const std::lock_guard lock(mutex_);
  const AppName& app = outcome.name;
  if (!finished_.emplace(app.kind, app.identifier).second) return false;
  const auto found = app.kind == NameKind::app ? running_.find(app.identifier) : running_.end();
  if (found != running_.end()) {
    moveTo(found->second, 1);
    ++arrived_;
    if (isSuccess(outcome.event)) report(found->second);
    running_.erase(found);
  }
  outcomes_.push_back(outcome);
  reporter_.finished(outcome);
  return true;
}

void SyncProgress::finishExpected(std::string_view identifier, AppEvent event, std::string_view reason) {
  AppOutcome outcome = {event, {}, std::string(reason)};
  {
    const std::lock_guard lock(mutex_);
    const auto found = running_.find(identifier);
    if (found == running_.end()) return;
    outcome.name = found->second.name;
  }
  finish(outcome);
}

const AppOutcomes& SyncProgress::summarise() {
  const std::lock_guard lock(mutex_);
  reporter_.summarise(outcomes_);
  return outcomes_;
}

void SyncProgress::advance(std::string_view identifier, AppStage stage, double fraction) {
  const std::lock_guard lock(mutex_);
  const auto found = running_.find(identifier);
  if (found == running_.end()) return;
  Running& running = found->second;
  moveTo(running, fraction);
  const bool isNewStage = std::exchange(running.stage, stage) != stage;
  const bool isDue = running.fraction - running.reported >= kSmallestStep &&
                     Clock::now() - running.reportedAt >= kShortestTimeBetweenReports;
  if (isNewStage || isDue) report(running);
}

void SyncProgress::report(Running& running) {
  running.reported = running.fraction;
  running.reportedAt = Clock::now();
  reporter_.progressed({running.name, running.stage, running.fraction, overall_, arrived_, expected_});
}

void SyncProgress::moveTo(Running& running, double fraction) {
  const double next = std::clamp(fraction, running.fraction, 1.0);
  done_ += running.weight * (next - running.fraction);
  running.fraction = next;
  overall_ = std::clamp(done_ / weight_, overall_, 1.0);
}

}  // namespace appsync::host
