// A counting semaphore on a clock.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>

#include "base/Clock.h"

namespace appsync {

/// Thread-safe. The semaphore may be destroyed as soon as the wait for its last signal
/// has returned, although that `signal` may still be returning on another thread.
class Semaphore {
 public:
  /// `initial` waits succeed without a signal. `clock` must outlive the semaphore.
  Semaphore(Clock& clock, std::ptrdiff_t initial) : clock_(clock), count_(initial) {}
  Semaphore(const Semaphore&) = delete;
  Semaphore& operator=(const Semaphore&) = delete;

  void signal();

  /// Consumes one signal, blocking until one is available. Returns false if `deadline` is reached first.
  bool wait(TimePoint deadline = kForever);

 private:
  Clock& clock_;
  std::mutex mutex_;
  std::condition_variable signalled_;
  std::ptrdiff_t count_;
};

}  // namespace appsync
