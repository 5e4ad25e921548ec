#include "base/OperationQueue.h"

#include <algorithm>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <stdexcept>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace appsync {

class OperationQueue::Workers : public std::enable_shared_from_this<Workers> {
 public:
  explicit Workers(std::size_t maximum) : maximum_(maximum) {
    if (maximum == 0) throw std::invalid_argument("an operation queue must run at least one operation at a time");
  }

  std::size_t maximum() const noexcept { return maximum_; }

  void add(std::function<void()> operation) {
    const std::lock_guard lock(mutex_);
    if (needsThread()) startThread();
    operations_.push_back(std::move(operation));
    added_.notify_one();
  }

  /// Makes the threads end when no operation is queued.
  void close() {
    {
      const std::lock_guard lock(mutex_);
      closed_ = true;
      added_.notify_all();
    }
    const bool onOwnThread =
        std::ranges::find(threads_, std::this_thread::get_id(), &std::thread::get_id) != threads_.end();
    for (std::thread& thread : threads_)
      onOwnThread ? thread.detach() : thread.join();
  }

 private:
  bool needsThread() const {
    const bool idleThreadIsLeft = idle_ > operations_.size();
    return !idleThreadIsLeft && threads_.size() < maximum_ && !closed_;
  }

  void startThread() {
    try {
      threads_.emplace_back([self = shared_from_this()] { self->run(); });
    } catch (const std::system_error&) {
      if (threads_.empty()) throw;  // Otherwise the existing threads run the operation.
    }
  }

  void run() {
    std::unique_lock lock(mutex_);
    while (true) {
      ++idle_;
      added_.wait(lock, [this] { return closed_ || !operations_.empty(); });
      --idle_;
      if (operations_.empty()) return;
      std::function<void()> operation = std::move(operations_.front());
      operations_.pop_front();
      lock.unlock();
      operation();
      operation = nullptr;  // May destroy the queue. Unlocked: the destructors of its captures may add operations.
      lock.lock();
    }
  }

  const std::size_t maximum_;
  std::mutex mutex_;
  std::condition_variable added_;
  std::deque<std::function<void()>> operations_;
  /// Threads that wait for an operation, including notified ones that have not woken yet.
  std::size_t idle_ = 0;
  bool closed_ = false;
  std::vector<std::thread> threads_;
};

OperationQueue::OperationQueue(std::size_t maxConcurrentOperations)
    : workers_(std::make_shared<Workers>(maxConcurrentOperations)) {}

OperationQueue::~OperationQueue() {
  workers_->close();
}

std::size_t OperationQueue::maxConcurrentOperations() const noexcept {
  return workers_->maximum();
}

void OperationQueue::add(std::function<void()> operation) {
  workers_->add(std::move(operation));
}

}  // namespace appsync
