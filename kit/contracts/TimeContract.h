// Contract of base/Clock.h and base/Scheduler.h.
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
  /// Advances a virtual clock by `duration`. Does nothing with a real clock, for which the tests wait.
  virtual void pass(Duration duration) = 0;
};

class TimeContract : public Contract<TimeSubject> {};

}  // namespace appsync::test
