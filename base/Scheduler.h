// Delayed execution, as a replaceable service.
#pragma once

#include <functional>

#include "base/Clock.h"

namespace appsync {

class Scheduler {
 public:
  virtual ~Scheduler() = default;

  /// Runs `task` once, `delay` from now, on a thread of the scheduler; never during this call.
  /// A delay that is not positive means as soon as possible. Tasks run in order of due time, those due at the same time
  /// in the order of these calls. `task` and its captures are destroyed right after it ran, or with the scheduler.
  /// Thread-safe; may be called by tasks. Throws std::system_error, and drops `task`, if a thread is needed and cannot
  /// be started.
  virtual void after(Duration delay, std::function<void()> task) = 0;
};

}  // namespace appsync
