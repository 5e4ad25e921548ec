// Holds clocks and schedulers to base/Clock.h and base/Scheduler.h.
#pragma once

#include "base/Clock.h"
#include "base/Scheduler.h"
#include "kit/contracts/Contract.h"

namespace appsync::test {

class TimeSubject {
 public:
  virtual ~TimeSubject() = default;

  [[nodiscard]] virtual Clock& clock() = 0;
  [[nodiscard]] virtual Scheduler& scheduler() = 0;
  /// Has that much time pass where somebody must see to it; time that passes by itself is waited for by the tests.
  virtual void pass(Duration duration) = 0;
};

class TimeContract : public Contract<TimeSubject> {};

}  // namespace appsync::test
