// Time that moves only when told to.
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

/// A clock and scheduler for whatever must not depend on real time. All operations may be called on any thread.
class VirtualTime final : public Clock, public Scheduler {
 public:
  VirtualTime() = default;
  /// Drops what is pending.
  ~VirtualTime() override;
  VirtualTime(const VirtualTime&) = delete;
  VirtualTime& operator=(const VirtualTime&) = delete;

  TimePoint now() const override;
  bool wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
            const std::function<bool()>& ready) override;
  void after(Duration delay, std::function<void()> task) override;

  /// Moves time on by `duration`: runs the tasks that fall due, also those that tasks add meanwhile, on the calling
  /// thread, in order of due time and then of scheduling, with now() at each one's due time; and wakes the waiters
  /// whose deadlines are reached. What a task throws ends the call, with time at that task's due time.
  /// Calls on several threads follow one another; a call from inside a task throws std::logic_error.
  void advance(Duration duration);

  /// Blocks until at least `count` tasks are pending.
  void waitUntilScheduled(std::size_t count) const;

  /// Blocks until at least `count` threads are blocked in `wait` with a deadline (not kForever) that is still to come.
  void waitUntilWaiting(std::size_t count) const;

  std::size_t pendingTasks() const;

  /// When the next pending task is due; none if there is none.
  std::optional<TimePoint> nextDue() const;

 private:
  using Tasks = std::multimap<TimePoint, std::function<void()>>;

  /// A thread in `wait`. Its own mutex and condition may go as soon as it has left.
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
  /// Never held while a waiter's own mutex is taken: waiters read the time with theirs locked.
  mutable std::mutex mutex_;
  mutable std::condition_variable changed_;
  TimePoint now_{};
  Tasks tasks_;
  Waiters waiters_;
};

}  // namespace appsync
