#include "base/SerialQueue.h"

#include <condition_variable>
#include <stdexcept>

namespace appsync {

struct SerialQueue::Waiter {
  std::thread::id thread;
  std::condition_variable turn;
};

SerialQueue::SerialQueue(std::string label) : label_(std::move(label)) {}

std::size_t SerialQueue::waiting() const {
  const std::lock_guard lock(mutex_);
  return waiters_.size();
}

void SerialQueue::begin() {
  if (isCurrent()) throw std::logic_error(label_ + ": work on this queue would wait for itself");
  std::unique_lock lock(mutex_);
  if (runner_.load() == std::thread::id()) {
    runner_ = std::this_thread::get_id();
    return;
  }
  Waiter waiter{std::this_thread::get_id(), {}};
  waiters_.push_back(&waiter);
  waiter.turn.wait(lock, [this] { return isCurrent(); });
}

void SerialQueue::end() noexcept {
  const std::lock_guard lock(mutex_);
  if (waiters_.empty()) {
    runner_ = std::thread::id();
    return;
  }
  Waiter& next = *waiters_.front();
  waiters_.pop_front();
  runner_ = next.thread;
  next.turn.notify_one();  // Under the lock: the waiter destroys its condition variable as soon as it has the lock.
}

}  // namespace appsync
