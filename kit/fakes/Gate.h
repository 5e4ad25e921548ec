// Stops threads at a chosen place until a test lets them go on.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>

namespace appsync::test {

/// Open at first. Threads: any.
class Gate {
 public:
  void close();
  /// Lets everyone go on.
  void open();

  /// Blocks while the gate is closed.
  void pass();

  /// Blocks until `count` threads are stopped at the gate.
  void waitUntilStopped(std::size_t count);
  [[nodiscard]] std::size_t stopped() const;

 private:
  mutable std::mutex mutex_;
  std::condition_variable changed_;
  bool closed_ = false;
  std::size_t stopped_ = 0;
};

}  // namespace appsync::test
