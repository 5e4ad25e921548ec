// Time that advances only on request.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <functional>
#include <list>
#include <map>
#include <mutex>
#include <optional>

#include "base/Clock.h"
#include "base/Scheduler.h"
#include "base/SerialQueue.h"

namespace appsync {

/// A clock and scheduler for code that must not depend on real time, such as tests. Thread-safe.
class VirtualTime final : public Clock, public Scheduler {
 public:
  VirtualTime() = default;
  /// Drops pending tasks.
  ~VirtualTime() override;
  VirtualTime(const VirtualTime&) = delete;
  VirtualTime& operator=(const VirtualTime&) = delete;

  TimePoint now() const override;
  bool wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
            const std::function<bool()>& ready) override;
  void after(Duration delay, std::function<void()> task) override;

  /// Advances time by `duration`: runs the tasks that become due, including tasks added by tasks, on the calling
  /// thread, in order of due time and then of scheduling, with now() at each task's due time, and wakes the waiters
  /// whose deadlines are reached. If a task throws, time stays at its due time and the exception is passed on.
  /// Concurrent calls are serialised; a call from a task throws std::logic_error.
  void advance(Duration duration);

  /// Blocks until at least `count` tasks are pending.
  void waitUntilScheduled(std::size_t count) const;

  /// Blocks until at least `count` threads are blocked in `wait` with a deadline (not kForever) in the future.
  void waitUntilWaiting(std::size_t count) const;

  std::size_t pendingTasks() const;

  /// Returns the due time of the next pending task, or nullopt if no task is pending.
  std::optional<TimePoint> nextDue() const;

 private:
  using Tasks = std::multimap<TimePoint, std::function<void()>>;

  /// A thread in `wait`. Its mutex and condition variable may be destroyed as soon as it has left.
  struct Waiter {
    std::condition_variable& condition;
    std::mutex& mutex;
    TimePoint deadline;
    bool beingWoken = false;
  };
  using Waiters = std::list<Waiter>;

  Tasks::node_type takeTaskDueBy(TimePoint target);
  void moveTo(TimePoint time);
  void leave(Waiters::iterator waiter);

  SerialQueue advances_{"advance of virtual time"};
  /// Never held while a waiter's mutex is locked: waiters read the time while they hold theirs.
  mutable std::mutex mutex_;
  mutable std::condition_variable changed_;
  TimePoint now_{};
  Tasks tasks_;
  Waiters waiters_;
};

}  // namespace appsync
