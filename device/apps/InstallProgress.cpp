#include "device/apps/InstallProgress.h"

namespace appsync::device {

using platform::TSInstallPhase;
using platform::TSInstallState;

template <class T>
void InstallProgress::change(T ProgressValues::*field, T value, Change kind) {
  {
    const std::scoped_lock lock(mutex_);
    if (ended_ || values_.*field == value) return;
    values_.*field = value;
  }
  listener_(*this, kind);
}

void InstallProgress::setInstallState(TSInstallState state) {
  change(&ProgressValues::state, state, Change::course);
}
void InstallProgress::setInstallPhase(TSInstallPhase phase) {
  change(&ProgressValues::phase, phase, Change::course);
}

void InstallProgress::setTotalUnitCount(std::int64_t units) {
  change(&ProgressValues::totalUnits, units, Change::units);
}

void InstallProgress::setCompletedUnitCount(std::int64_t units) {
  change(&ProgressValues::completedUnits, units, Change::units);
}

void InstallProgress::cancel() {
  {
    const std::scoped_lock lock(mutex_);
    if (ended_ || values_.state >= TSInstallState::Canceled) return;
    values_.state = TSInstallState::Canceled;
    ended_ = true;
  }
  listener_(*this, Change::cancelled);
}

void InstallProgress::set(const ProgressValues& values) {
  {
    const std::scoped_lock lock(mutex_);
    if (ended_ || values_ == values) return;
    values_ = values;
  }
  listener_(*this, Change::course);
}

void InstallProgress::end(TSInstallState state) {
  const std::scoped_lock lock(mutex_);
  if (ended_) return;
  values_.state = state;
  ended_ = true;
}

ProgressValues InstallProgress::values() const {
  const std::scoped_lock lock(mutex_);
  return values_;
}

bool InstallProgress::ended() const {
  const std::scoped_lock lock(mutex_);
  return ended_;
}

std::string InstallProgress::description() const {
  const ProgressValues now = values();
  const auto number = [](auto value) { return std::to_string(static_cast<std::uint64_t>(value)); };
  return identifier_ + ": TSInstallState " + number(now.state) + ", TSInstallPhase " + number(now.phase) + ", " +
         std::to_string(now.completedUnits) + " of " + std::to_string(now.totalUnits);
}

}  // namespace appsync::device
