#include "base/SystemClock.h"

namespace appsync {

TimePoint SystemClock::now() const {
  return std::chrono::steady_clock::now();
}

bool SystemClock::wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
                       const std::function<bool()>& ready) {
  if (deadline != kForever) return condition.wait_until(lock, deadline, ready);
  condition.wait(lock, ready);
  return true;
}

}  // namespace appsync
