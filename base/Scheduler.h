// Work to be done later, as a replaceable service.
#pragma once

#include <functional>

#include "base/Clock.h"

namespace appsync {

class Scheduler {
 public:
  virtual ~Scheduler() = default;

  /// Runs `task` once, `delay` from now, on a thread of the scheduler's own; never inside this call.
  /// A delay that is not positive means as soon as possible. Tasks run in order of due time, those due at the same time
  /// in the order of these calls. `task` and all it captures are destroyed right after it ran, or with the scheduler.
  /// May be called on any thread, from tasks too. Throws std::system_error, and drops `task`, if that takes a thread
  /// and the system has none.
  virtual void after(Duration delay, std::function<void()> task) = 0;
};

}  // namespace appsync
