// Runs operations on threads, a bounded number at a time.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>

namespace appsync {

/// Operations start in the order in which they were added, at most `maxConcurrentOperations` run at once. Threads are
/// started on demand and then sleep between operations. An operation that throws ends the program.
///
/// An operation, with everything it captures, is destroyed right after it ran and before its thread takes the next one.
/// What it captures may be the last owner of the object that owns the queue. Destroyed on a thread of its own the queue
/// returns at once, and operations that are still queued run on; destroyed on any other thread it returns when every
/// operation has run.
class OperationQueue {
 public:
  /// Throws std::invalid_argument if `maxConcurrentOperations` is 0.
  explicit OperationQueue(std::size_t maxConcurrentOperations);
  ~OperationQueue();
  OperationQueue(const OperationQueue&) = delete;
  OperationQueue& operator=(const OperationQueue&) = delete;

  std::size_t maxConcurrentOperations() const noexcept;

  /// May be called on any thread, from operations too. Throws std::system_error, and does not add `operation`, if no
  /// thread runs yet and none can be started.
  void add(std::function<void()> operation);

 private:
  class Workers;
  /// Shared with the threads, which may outlive this object.
  std::shared_ptr<Workers> workers_;
};

}  // namespace appsync
