// Stops threads until a test lets them continue.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>

namespace appsync::test {

/// Initially open. Thread-safe.
class Gate {
 public:
  void close();
  /// Lets all stopped threads continue.
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
