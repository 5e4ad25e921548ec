// A counter of events on other threads.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>

#include "kit/fakes/Patience.h"

namespace appsync::test {

/// Thread-safe.
class EventCounter {
 public:
  void add() {
    const std::scoped_lock lock(mutex_);
    ++count_;
    changed_.notify_all();
  }

  /// Blocks until there were `count` events. Returns false on a time-out.
  [[nodiscard]] bool waitFor(std::size_t count) {
    std::unique_lock lock(mutex_);
    return changed_.wait_for(lock, kPatience, [&] { return count_ >= count; });
  }

  [[nodiscard]] std::size_t count() {
    const std::scoped_lock lock(mutex_);
    return count_;
  }

 private:
  std::mutex mutex_;
  std::condition_variable changed_;
  std::size_t count_ = 0;
};

}  // namespace appsync::test
