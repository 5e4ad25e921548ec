// A scheduler that runs tasks on one thread.
#pragma once

#include <memory>

#include "base/Scheduler.h"

namespace appsync {

/// One thread, started by the first `after`, runs all tasks. A task that throws ends the program.
///
/// The destructor drops the tasks that are not due and returns when the due ones have run: no task starts after it. It
/// may run on the scheduler's thread, during a task or the destruction of a task's captures; it then waits for all
/// tasks except that one.
class ThreadScheduler final : public Scheduler {
 public:
  /// `clock` must outlive the scheduler.
  explicit ThreadScheduler(Clock& clock);
  ~ThreadScheduler() override;
  ThreadScheduler(const ThreadScheduler&) = delete;
  ThreadScheduler& operator=(const ThreadScheduler&) = delete;

  /// Throws std::system_error if the thread cannot be started.
  void after(Duration delay, std::function<void()> task) override;

  /// Does what the destructor does. Tasks that are added later are dropped.
  void close();

 private:
  class Agenda;
  /// Shared with the thread, which may outlive this object.
  std::shared_ptr<Agenda> agenda_;
};

}  // namespace appsync
