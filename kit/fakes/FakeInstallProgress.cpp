#include "kit/fakes/FakeInstallProgress.h"

#include <utility>

namespace appsync::test {

using platform::TSInstallPhase;
using platform::TSInstallState;

std::vector<std::string> FakeInstallProgress::calls() const {
  const std::scoped_lock lock(mutex_);
  return calls_;
}

void FakeInstallProgress::attach(Listener listener) {
  const std::scoped_lock lock(listenerMutex_);
  listener_ = std::move(listener);
}

template <class T>
bool FakeInstallProgress::set(std::string call, T& field, T value) {
  const std::scoped_lock listenerLock(listenerMutex_);
  {
    const std::scoped_lock lock(mutex_);
    calls_.push_back(call);
  }
  if (listener_.mayCall && !listener_.mayCall(call)) return false;
  const std::scoped_lock lock(mutex_);
  if (ended_) return false;
  field = value;
  return true;
}

void FakeInstallProgress::end(TSInstallState lastState) {
  const std::scoped_lock lock(mutex_);
  ended_ = true;
  state_ = lastState;
}

void FakeInstallProgress::enter(TSInstallPhase phase) {
  const std::scoped_lock lock(mutex_);
  if (!ended_) phase_ = phase;
}

TSInstallState FakeInstallProgress::installState() const {
  const std::scoped_lock lock(mutex_);
  return state_;
}

void FakeInstallProgress::setInstallState(TSInstallState state) {
  set("setInstallState " + std::to_string(static_cast<std::uint64_t>(state)), state_, state);
}

TSInstallPhase FakeInstallProgress::installPhase() const {
  const std::scoped_lock lock(mutex_);
  return phase_;
}

void FakeInstallProgress::setInstallPhase(TSInstallPhase phase) {
  set("setInstallPhase " + std::to_string(static_cast<std::uint64_t>(phase)), phase_, phase);
}

std::int64_t FakeInstallProgress::totalUnitCount() const {
  const std::scoped_lock lock(mutex_);
  return totalUnitCount_;
}

void FakeInstallProgress::setTotalUnitCount(std::int64_t units) {
  set("setTotalUnitCount " + std::to_string(units), totalUnitCount_, units);
}

std::int64_t FakeInstallProgress::completedUnitCount() const {
  const std::scoped_lock lock(mutex_);
  return completedUnitCount_;
}

void FakeInstallProgress::setCompletedUnitCount(std::int64_t units) {
  set("setCompletedUnitCount " + std::to_string(units), completedUnitCount_, units);
}

void FakeInstallProgress::cancel() {
  const std::scoped_lock listenerLock(listenerMutex_);
  if (set("cancel", state_, TSInstallState::Canceled) && listener_.wasCancelled) listener_.wasCancelled();
}

}  // namespace appsync::test
