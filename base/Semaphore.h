// A counting semaphore on a clock.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>

#include "base/Clock.h"

namespace appsync {

/// All operations may be called on any thread. The semaphore may be destroyed as soon as the wait for its last signal
/// has returned, although that `signal` may still be returning on another thread.
class Semaphore {
 public:
  /// `initial` waits succeed without a signal. `clock` must outlive the semaphore.
  Semaphore(Clock& clock, std::ptrdiff_t initial) : clock_(clock), count_(initial) {}
  Semaphore(const Semaphore&) = delete;
  Semaphore& operator=(const Semaphore&) = delete;

  void signal();

  /// Takes one signal, waiting for it if there is none; false if none came until the clock read `deadline`.
  bool wait(TimePoint deadline = kForever);

 private:
  Clock& clock_;
  std::mutex mutex_;
  std::condition_variable signalled_;
  std::ptrdiff_t count_;
};

}  // namespace appsync
