// The system clock.
#pragma once

#include "base/Clock.h"

namespace appsync {

/// Monotonic time: not affected by changes of the time of day.
class SystemClock final : public Clock {
 public:
  TimePoint now() const override;
  bool wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
            const std::function<bool()>& ready) override;
};

}  // namespace appsync
