// A labelled lock that is granted in the order of requests.
#pragma once

#include <atomic>
#include <cstddef>
#include <deque>
#include <mutex>
#include <string>
#include <thread>
#include <utility>

namespace appsync {

/// A serial queue with synchronous submission only: work items run one at a time, in the order of submission, each on
/// the submitting thread. Thread-safe.
class SerialQueue {
 public:
  explicit SerialQueue(std::string label);
  ~SerialQueue() = default;
  SerialQueue(const SerialQueue&) = delete;
  SerialQueue& operator=(const SerialQueue&) = delete;

  const std::string& label() const noexcept { return label_; }

  /// Runs `work` when all work submitted before has ended, and returns (or throws) what it does.
  /// Throws std::logic_error, with the label in its text, if the calling thread is already running work of this queue,
  /// because it would deadlock.
  template <class F>
  auto sync(F&& work) -> decltype(work()) {
    const Turn turn(*this);
    return std::forward<F>(work)();
  }

  /// Whether the calling thread is running this queue's work.
  bool isCurrent() const noexcept { return runner_.load() == std::this_thread::get_id(); }

  /// Returns the number of threads that wait for their turn.
  std::size_t waiting() const;

 private:
  struct Waiter;

  class Turn {
   public:
    explicit Turn(SerialQueue& queue) : queue_(queue) { queue_.begin(); }
    ~Turn() { queue_.end(); }
    Turn(const Turn&) = delete;
    Turn& operator=(const Turn&) = delete;

   private:
    SerialQueue& queue_;
  };

  void begin();
  void end() noexcept;

  const std::string label_;
  mutable std::mutex mutex_;
  /// Threads that wait for their turn, in order. Each has its own condition variable, so that each turn wakes one
  /// thread.
  std::deque<Waiter*> waiters_;
  /// The thread whose turn it is, or the default id if the queue is idle. Written under mutex_.
  std::atomic<std::thread::id> runner_;
};

}  // namespace appsync
