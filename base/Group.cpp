#include "base/Group.h"

#include <stdexcept>

namespace appsync {

void Group::enter() {
  const std::lock_guard lock(mutex_);
  ++count_;
}

void Group::leave() {
  const std::lock_guard lock(mutex_);
  if (count_ == 0) throw std::logic_error("a group was left more often than entered");
  if (--count_ > 0) return;
  ++timesEmptied_;
  emptied_.notify_all();  // Under the lock: a waiter may destroy the group as soon as it has the lock.
}

void Group::wait() {
  wait(kForever);
}

bool Group::wait(TimePoint deadline) {
  std::unique_lock lock(mutex_);
  const std::uint64_t before = timesEmptied_;
  return clock_.wait(emptied_, lock, deadline, [this, before] { return count_ == 0 || timesEmptied_ != before; });
}

std::int64_t Group::count() const {
  const std::lock_guard lock(mutex_);
  return count_;
}

}  // namespace appsync
