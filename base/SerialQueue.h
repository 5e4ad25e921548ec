// A labelled lock that hands itself on in the order of asking.
#pragma once

#include <atomic>
#include <cstddef>
#include <deque>
#include <mutex>
#include <string>
#include <thread>
#include <utility>

namespace appsync {

/// A serial queue that is only ever submitted to synchronously: pieces of work run one at a time, in the order in which
/// they were submitted, each on the thread that submits it.
class SerialQueue {
 public:
  explicit SerialQueue(std::string label);
  ~SerialQueue() = default;
  SerialQueue(const SerialQueue&) = delete;
  SerialQueue& operator=(const SerialQueue&) = delete;

  const std::string& label() const noexcept { return label_; }

  /// Runs `work` when all work submitted before has ended, and returns (or throws) what it does.
  /// Throws std::logic_error, with the label in its text, if the calling thread is running this queue's work already:
  /// waiting for itself it would never return.
  template <class F>
  auto sync(F&& work) -> decltype(work()) {
    const Turn turn(*this);
    return std::forward<F>(work)();
  }

  /// Whether the calling thread is running this queue's work.
  bool isCurrent() const noexcept { return runner_.load() == std::this_thread::get_id(); }

  /// How many threads wait for their turn now.
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
  /// Threads that wait for their turn, in order; each waits on a condition of its own, so that one turn wakes one
  /// thread.
  std::deque<Waiter*> waiters_;
  /// The thread whose turn it is; none if the queue is idle. Written under mutex_.
  std::atomic<std::thread::id> runner_;
};

}  // namespace appsync
