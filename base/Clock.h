// Time and waiting, as one replaceable service.
#pragma once

#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>

namespace appsync {

using TimePoint = std::chrono::steady_clock::time_point;
using Duration = std::chrono::nanoseconds;

/// The deadline that never comes.
inline constexpr TimePoint kForever = TimePoint::max();

/// `delay` after `start`; `start` itself if the delay is negative, kForever if time does not reach so far.
constexpr TimePoint deadlineAfter(TimePoint start, Duration delay) {
  if (delay <= Duration::zero()) return start;
  return start > kForever - delay ? kForever : start + delay;
}

/// Everything that waits asks a clock, so that a test can make hours pass in no time.
/// All operations may be called on any thread.
class Clock {
 public:
  virtual ~Clock() = default;

  /// Never goes back.
  virtual TimePoint now() const = 0;

  /// Blocks on `condition` until `ready()` is true or the clock reads `deadline`, and returns `ready()`.
  ///
  /// As with condition variables, `lock` is held at the call, at every call of `ready` and at the return, and whoever
  /// makes `ready()` true does so under the same mutex and notifies `condition`. `ready` does not throw. Returns at
  /// once if `ready()` is true already, however late it is.
  virtual bool wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
                    const std::function<bool()>& ready) = 0;
};

}  // namespace appsync
