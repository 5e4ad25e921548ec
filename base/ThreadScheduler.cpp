#include "base/ThreadScheduler.h"

#include <condition_variable>
#include <map>
#include <mutex>
#include <thread>
#include <utility>

namespace appsync {

class ThreadScheduler::Agenda : public std::enable_shared_from_this<Agenda> {
 public:
  explicit Agenda(Clock& clock) : clock_(clock) {}

  void add(Duration delay, std::function<void()> task) {
    const std::lock_guard lock(mutex_);
    if (closed_) return;
    if (!thread_.joinable()) thread_ = std::thread([self = shared_from_this()] { self->run(); });
    tasks_.emplace(deadlineAfter(clock_.now(), delay), std::move(task));
    changed_.notify_one();
  }

  void close() {
    dropTasksNotDue();
    if (thread_.get_id() == std::this_thread::get_id()) {
      thread_.detach();
      run();
    } else if (thread_.joinable()) {
      thread_.join();
    }
  }

 private:
  using Tasks = std::multimap<TimePoint, std::function<void()>>;

  void run() {
    std::unique_lock lock(mutex_);
    while (awaitTask(lock)) {
      Tasks::node_type task = tasks_.extract(tasks_.begin());
      lock.unlock();
      task.mapped()();
      task = {};  // May destroy the scheduler. Unlocked: the destructors of its captures may schedule tasks.
      lock.lock();
    }
  }

  /// Blocks until the first task is due. Returns false if the scheduler is closed and no task is left.
  bool awaitTask(std::unique_lock<std::mutex>& lock) {
    while (!closed_) {
      const TimePoint due = nextDue();
      if (!tasks_.empty() && due <= clock_.now()) return true;
      clock_.wait(changed_, lock, due, [this, due] { return closed_ || nextDue() < due; });
    }
    return !tasks_.empty();
  }

  TimePoint nextDue() const { return tasks_.empty() ? kForever : tasks_.begin()->first; }

  void dropTasksNotDue() {
    Tasks dropped;  // Destroyed last, unlocked: the destructors of captures may call the scheduler.
    const std::lock_guard lock(mutex_);
    closed_ = true;
    for (auto task = tasks_.upper_bound(clock_.now()); task != tasks_.end();)
      dropped.insert(tasks_.extract(task++));
    changed_.notify_one();
  }

  Clock& clock_;
  std::mutex mutex_;
  std::condition_variable changed_;
  Tasks tasks_;
  bool closed_ = false;
  std::thread thread_;
};

ThreadScheduler::ThreadScheduler(Clock& clock) : agenda_(std::make_shared<Agenda>(clock)) {}

ThreadScheduler::~ThreadScheduler() {
  close();
}

void ThreadScheduler::close() {
  agenda_->close();
}

void ThreadScheduler::after(Duration delay, std::function<void()> task) {
  agenda_->add(delay, std::move(task));
}

}  // namespace appsync
