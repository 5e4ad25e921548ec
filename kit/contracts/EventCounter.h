// Counts what happens on other threads.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <mutex>

namespace appsync::test {

/// Threads: any.
class EventCounter {
 public:
  void add() {
    const std::scoped_lock lock(mutex_);
    ++count_;
    changed_.notify_all();
  }

  /// Blocks until it has happened `count` times; false when that takes unreasonably long.
  [[nodiscard]] bool waitFor(std::size_t count) {
    std::unique_lock lock(mutex_);
    return changed_.wait_for(lock, kPatience, [&] { return count_ >= count; });
  }

  [[nodiscard]] std::size_t count() {
    const std::scoped_lock lock(mutex_);
    return count_;
  }

 private:
  /// The end of a test that would hang, never a pace.
  static constexpr std::chrono::seconds kPatience{20};

  std::mutex mutex_;
  std::condition_variable changed_;
  std::size_t count_ = 0;
};

}  // namespace appsync::test
