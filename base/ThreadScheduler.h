// A scheduler with a thread.
#pragma once

#include <memory>

#include "base/Scheduler.h"

namespace appsync {

/// One thread, started by the first `after`, runs all tasks. A task that throws ends the program.
///
/// Destruction drops the tasks that are not yet due and returns when those that are due have run: no task starts after
/// it. It may happen on the scheduler's own thread, that is inside a task or in the destruction of what a task
/// captured; that task is then the only one that is not waited for.
class ThreadScheduler final : public Scheduler {
 public:
  /// `clock` tells the time and must outlive the scheduler.
  explicit ThreadScheduler(Clock& clock);
  ~ThreadScheduler() override;
  ThreadScheduler(const ThreadScheduler&) = delete;
  ThreadScheduler& operator=(const ThreadScheduler&) = delete;

  /// Throws std::system_error if the thread cannot be started.
  void after(Duration delay, std::function<void()> task) override;

  /// Does already what destruction does. Of the tasks that come after it none runs; each is dropped as it comes.
  void close();

 private:
  class Agenda;
  /// Shared with the thread, which may outlive this object.
  std::shared_ptr<Agenda> agenda_;
};

}  // namespace appsync
