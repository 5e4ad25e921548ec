#include "base/Semaphore.h"

namespace appsync {

void Semaphore::signal() {
  const std::lock_guard lock(mutex_);
  ++count_;
  signalled_.notify_one();  // Under the lock: a waiter may destroy the semaphore as soon as it has the lock.
}

bool Semaphore::wait(TimePoint deadline) {
  std::unique_lock lock(mutex_);
  if (!clock_.wait(signalled_, lock, deadline, [this] { return count_ > 0; })) return false;
  --count_;
  return true;
}

}  // namespace appsync
