// Time and waiting, as one replaceable service.
#pragma once

#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>

namespace appsync {

using TimePoint = std::chrono::steady_clock::time_point;
using Duration = std::chrono::nanoseconds;

/// A deadline that is never reached.
inline constexpr TimePoint kForever = TimePoint::max();

/// Returns the time `delay` after `start`: `start` if the delay is negative, kForever if the sum overflows.
constexpr TimePoint deadlineAfter(TimePoint start, Duration delay) {
  if (delay <= Duration::zero()) return start;
  return start > kForever - delay ? kForever : start + delay;
}

/// Every timed wait uses a clock, so that tests can use VirtualTime. Thread-safe.
class Clock {
 public:
  virtual ~Clock() = default;

  /// Monotonic.
  virtual TimePoint now() const = 0;

  /// Blocks on `condition` until `ready()` is true or the clock reads `deadline`, and returns `ready()`.
  ///
  /// As with condition variables, `lock` is held at the call, at every call of `ready` and at the return; the thread
  /// that makes `ready()` true must hold the same mutex and notify `condition`. `ready` must not throw. Returns at once
  /// if `ready()` is already true, even after `deadline`.
  virtual bool wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
                    const std::function<bool()>& ready) = 0;
};

}  // namespace appsync
