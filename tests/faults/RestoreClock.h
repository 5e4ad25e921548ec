// A clock for the wait of a restore.
#pragma once

#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

/// Virtual time: a wait lets the install-coordination service finish its pending actions; if the condition is still
/// false, the deadline is reached. So the order of all calls is fixed.
class RestoreClock final : public Clock {
 public:
  explicit RestoreClock(FakePlatform& platform) : platform_(platform) {}

  [[nodiscard]] TimePoint now() const override { return platform_.time.now(); }

  bool wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
            const std::function<bool()>& ready) override {
    if (deadline == kForever) return platform_.time.wait(condition, lock, deadline, ready);
    lock.unlock();
    platform_.coordination.runUntilIdle();
    lock.lock();
    if (ready()) return true;
    lock.unlock();
    if (deadline > now()) platform_.time.advance(deadline - now());
    lock.lock();
    return ready();
  }

 private:
  FakePlatform& platform_;
};

}  // namespace appsync::test
