#include "device/apps/RegistryObservers.h"

#include <utility>

namespace appsync::device {

namespace {

/// The object whose callback this thread is running, or null.
thread_local const RegistryObservers* callingBack = nullptr;

}  // namespace

void RegistryObservers::add(platform::AppRegistryObserver& observer) {
  const std::scoped_lock lock(mutex_);
  const auto [place, added] = observers_.try_emplace(&observer);
  if (!added) return;
  if (callbacks_ == nullptr) callbacks_ = std::make_shared<CallbackThread>();
  postReport(observer, place->second);
}

void RegistryObservers::remove(platform::AppRegistryObserver& observer) {
  std::shared_ptr<CallbackThread> callbacks;
  CallbackThread* thread = nullptr;
  {
    const std::scoped_lock lock(mutex_);
    if (observers_.erase(&observer) == 0) return;
    thread = callbacks_.get();
    // A callback must not own its thread: it would join itself.
    if (callingBack != this) callbacks = observers_.empty() ? std::move(callbacks_) : callbacks_;
  }
  thread->forget(&observer);
}

void RegistryObservers::orderChanged() {
  const std::scoped_lock lock(mutex_);
  for (auto& [observer, state] : observers_) {
    postReport(*observer, state);
  }
}

void RegistryObservers::postReport(platform::AppRegistryObserver& observer, State& state) {
  if (std::exchange(state.reportQueued, true)) return;
  callbacks_->post(&observer, [this, &observer] {
    {
      const std::scoped_lock lock(mutex_);
      const auto found = observers_.find(&observer);
      if (found == observers_.end()) return;  // The observer is being removed.
      found->second.reportQueued = false;
    }
    const InstallOrder order = order_();
    callingBack = this;
    observer.applicationInstallsArePrioritized(order.prioritized, order.paused);
    callingBack = nullptr;
  });
}

void RegistryObservers::cancelled(const std::shared_ptr<const platform::AppRecord>& record) {
  const std::scoped_lock lock(mutex_);
  for (auto& [observer, state] : observers_) {
    callbacks_->post(observer, [this, observer = observer, records = platform::AppRecords{record}] {
      callingBack = this;
      observer->applicationInstallsDidCancel(records);
      callingBack = nullptr;
    });
  }
}

}  // namespace appsync::device
