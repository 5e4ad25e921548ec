#include "device/apps/RunningInstalls.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "device/apps/AppRecord.h"

namespace appsync::device {

using platform::TSInstallPhase;
using platform::TSInstallState;

namespace {

/// Limits the database writes while users see regular progress.
constexpr std::chrono::milliseconds kBetweenStoredUnits{250};

}  // namespace

InstallProgress::Listener RunningInstalls::listener() {
  // A progress can outlive the registry.
  return [self = weak_from_this()](InstallProgress& progress, InstallProgress::Change change) {
    if (const auto installs = self.lock()) installs->changed(progress, change);
  };
}

void RunningInstalls::resume() {
  Result<std::vector<AppRow>> stored = [this] {
    Database::Session session(database_);
    return app_table::withProgress(session);
  }();
  if (!stored) return;
  for (AppRow& app : *stored) {
    const ProgressValues values = *app.progress;
    begin(std::move(app), values);
  }
}

std::shared_ptr<InstallProgress> RunningInstalls::begin(AppRow app, const ProgressValues& values) {
  std::shared_ptr<InstallProgress> progress;
  bool isNew = false;
  {
    const std::scoped_lock lock(mutex_);
    Run& run = runs_[app.identifier];
    isNew = run.progress == nullptr;
    if (isNew) {
      run.progress = std::make_shared<InstallProgress>(app.identifier, values, listener());
      run.rank = ++lastRank_;
    }
    progress = run.progress;
    run.record = std::make_shared<AppRecord>(std::move(app), progress);
  }
  if (isNew) {
    store(*progress);
  } else {
    progress->set(values);
  }
  observers_.orderChanged();
  return progress;
}

std::shared_ptr<InstallProgress> RunningInstalls::find(std::string_view identifier) const {
  const std::scoped_lock lock(mutex_);
  const auto found = runs_.find(identifier);
  return found == runs_.end() ? nullptr : found->second.progress;
}

void RunningInstalls::end(std::string_view identifier, TSInstallState lastState) {
  std::shared_ptr<InstallProgress> progress;
  {
    const std::scoped_lock lock(mutex_);
    const auto found = runs_.find(identifier);
    if (found == runs_.end()) return;
    progress = std::move(found->second.progress);
    runs_.erase(found);
  }
  progress->end(lastState);
  store(*progress);
  observers_.orderChanged();
}

void RunningInstalls::phaseFinished(const platform::InstallProgress& progress) {
  const auto* own = dynamic_cast<const InstallProgress*>(&progress);
  if (own == nullptr) return;
  const std::shared_ptr<InstallProgress> running = find(own->identifier());
  if (running.get() != own) return;
  const TSInstallState state = running->installState();
  if (state < TSInstallState::Canceled) {
    running->setInstallPhase(TSInstallPhase::Installing);
  } else {
    end(own->identifier(), state);
  }
}

void RunningInstalls::prioritize(std::string_view identifier) {
  {
    const std::scoped_lock lock(mutex_);
    const auto found = runs_.find(identifier);
    if (found == runs_.end()) return;
    found->second.rank = --firstRank_;
  }
  observers_.orderChanged();
}

InstallOrder RunningInstalls::order() const {
  const std::scoped_lock lock(mutex_);
  std::vector<const Run*> ranked;
  for (const auto& [identifier, run] : runs_) {
    if (run.progress->installState() < TSInstallState::Canceled) ranked.push_back(&run);
  }
  std::ranges::sort(ranked, {}, &Run::rank);
  InstallOrder order;
  for (const Run* run : ranked) {
    const bool isPaused = run->progress->installState() == TSInstallState::Paused;
    (isPaused ? order.paused : order.prioritized).push_back(run->record);
  }
  return order;
}

void RunningInstalls::changed(InstallProgress& progress, InstallProgress::Change change) {
  const auto now = std::chrono::steady_clock::now();
  std::shared_ptr<const platform::AppRecord> cancelled;
  {
    const std::scoped_lock lock(mutex_);
    const auto found = runs_.find(progress.identifier());
    if (found == runs_.end() || found->second.progress.get() != &progress) return;
    Run& run = found->second;
    if (change == InstallProgress::Change::units && now - run.storedAt < kBetweenStoredUnits) return;
    run.storedAt = now;
    if (change == InstallProgress::Change::cancelled) {
      cancelled = run.record;
      runs_.erase(found);
    }
  }
  store(progress);
  if (change == InstallProgress::Change::units) return;
  if (cancelled != nullptr) observers_.cancelled(cancelled);
  observers_.orderChanged();
}

void RunningInstalls::store(const InstallProgress& progress) {
  Database::Session session(database_);
  // Read after the session was opened: of two concurrent changes the later value is stored last.
  const auto values = progress.ended() ? std::nullopt : std::optional(progress.values());
  app_table::storeProgress(session, progress.identifier(), values).ignore();
}

}  // namespace appsync::device
