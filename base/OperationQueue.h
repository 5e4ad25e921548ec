// Runs operations on threads, a bounded number at a time.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>

namespace appsync {

/// Operations start in the order in which they were added; at most `maxConcurrentOperations` run at once. Threads are
/// started on demand and then sleep between operations. An operation that throws ends the program.
///
/// An operation and everything it captures are destroyed right after it ran and before its thread runs the next one.
/// A capture may be the last owner of the object that owns the queue. On one of the queue's threads the destructor
/// returns at once, and queued operations still run; on any other thread it returns when every operation has run.
class OperationQueue {
 public:
  /// Throws std::invalid_argument if `maxConcurrentOperations` is 0.
  explicit OperationQueue(std::size_t maxConcurrentOperations);
  ~OperationQueue();
  OperationQueue(const OperationQueue&) = delete;
  OperationQueue& operator=(const OperationQueue&) = delete;

  std::size_t maxConcurrentOperations() const noexcept;

  /// Thread-safe; may be called by operations. Throws std::system_error, and does not add `operation`, if the queue has
  /// no thread and cannot start one.
  void add(std::function<void()> operation);

 private:
  class Workers;
  /// Shared with the threads, which may outlive this object.
  std::shared_ptr<Workers> workers_;
};

}  // namespace appsync
