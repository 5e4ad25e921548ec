#include "base/VirtualTime.h"

#include <algorithm>
#include <utility>

namespace appsync {

VirtualTime::~VirtualTime() {
  while (takeTaskDueBy(kForever)) {
  }
}

TimePoint VirtualTime::now() const {
  const std::lock_guard own(mutex_);
  return now_;
}

bool VirtualTime::wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
                       const std::function<bool()>& ready) {
  if (deadline == kForever) {
    condition.wait(lock, ready);
    return true;
  }
  while (!ready()) {
    std::unique_lock own(mutex_);
    if (now_ >= deadline) return false;
    const auto self = waiters_.insert(waiters_.end(), {condition, *lock.mutex(), deadline});
    changed_.notify_all();
    own.unlock();
    condition.wait(lock, [&] { return ready() || now() >= deadline; });
    lock.unlock();
    leave(self);
    lock.lock();
  }
  return true;
}

void VirtualTime::leave(Waiters::iterator waiter) {
  std::unique_lock own(mutex_);
  changed_.wait(own, [&] { return !waiter->beingWoken; });
  waiters_.erase(waiter);
}

void VirtualTime::after(Duration delay, std::function<void()> task) {
  const std::lock_guard own(mutex_);
  tasks_.emplace(deadlineAfter(now_, delay), std::move(task));
  changed_.notify_all();
}

void VirtualTime::advance(Duration duration) {
  advances_.sync([&] {
    const TimePoint target = deadlineAfter(now(), duration);
    while (auto task = takeTaskDueBy(target)) {
      moveTo(task.key());
      task.mapped()();
    }
    moveTo(target);
  });
}

VirtualTime::Tasks::node_type VirtualTime::takeTaskDueBy(TimePoint target) {
  const std::lock_guard own(mutex_);
  if (tasks_.empty() || tasks_.begin()->first > target) return {};
  return tasks_.extract(tasks_.begin());
}

void VirtualTime::moveTo(TimePoint time) {
  std::unique_lock own(mutex_);
  now_ = std::max(now_, time);
  for (Waiter& waiter : waiters_) {
    if (waiter.deadline > now_) continue;
    waiter.beingWoken = true;  // Keeps it from leaving, so that its mutex can be locked without holding ours.
    own.unlock();
    {
      const std::lock_guard theirs(waiter.mutex);
      waiter.condition.notify_all();
    }
    own.lock();
    waiter.beingWoken = false;
    changed_.notify_all();
  }
}

void VirtualTime::waitUntilScheduled(std::size_t count) const {
  std::unique_lock own(mutex_);
  changed_.wait(own, [&] { return tasks_.size() >= count; });
}

void VirtualTime::waitUntilWaiting(std::size_t count) const {
  std::unique_lock own(mutex_);
  changed_.wait(own, [&] {
    const auto waiting = std::ranges::count_if(waiters_, [&](const Waiter& waiter) { return waiter.deadline > now_; });
    return static_cast<std::size_t>(waiting) >= count;
  });
}

std::size_t VirtualTime::pendingTasks() const {
  const std::lock_guard own(mutex_);
  return tasks_.size();
}

std::optional<TimePoint> VirtualTime::nextDue() const {
  const std::lock_guard own(mutex_);
  if (tasks_.empty()) return std::nullopt;
  return tasks_.begin()->first;
}

}  // namespace appsync
