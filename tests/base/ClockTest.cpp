// What every clock promises, on the machine's clock and on the virtual one.
#include <condition_variable>
#include <mutex>
#include <thread>

#include <gtest/gtest.h>

#include "base/Clock.h"
#include "base/SystemClock.h"
#include "base/VirtualTime.h"

namespace appsync::test {
namespace {

using namespace std::chrono_literals;

static_assert(deadlineAfter(TimePoint(), 5s) == TimePoint(5s));
static_assert(deadlineAfter(TimePoint(5s), -2s) == TimePoint(5s), "a deadline is not before its start");
static_assert(deadlineAfter(TimePoint(5s), Duration::max()) == kForever, "time does not wrap around");
static_assert(deadlineAfter(kForever - 1ns, 1ns) == kForever);

template <class AnyClock>
class ClockContract : public testing::Test {
 protected:
  bool waitUntil(TimePoint deadline) {
    std::unique_lock lock(mutex);
    const bool result = clock.wait(condition, lock, deadline, [this] { return ready; });
    EXPECT_TRUE(lock.owns_lock());
    return result;
  }

  void makeReady() {
    const std::lock_guard lock(mutex);
    ready = true;
    condition.notify_all();
  }

  AnyClock clock;
  std::mutex mutex;
  std::condition_variable condition;
  bool ready = false;
};

using Clocks = testing::Types<SystemClock, VirtualTime>;
TYPED_TEST_SUITE(ClockContract, Clocks);

TYPED_TEST(ClockContract, NeverGoesBack) {
  const TimePoint before = this->clock.now();
  EXPECT_GE(this->clock.now(), before);
}

TYPED_TEST(ClockContract, DoesNotWaitForWhatIsReadyEvenWhenItIsLate) {
  this->ready = true;
  EXPECT_TRUE(this->waitUntil(this->clock.now() - 1h));
  EXPECT_TRUE(this->waitUntil(this->clock.now() + 1h));
  EXPECT_TRUE(this->waitUntil(kForever));
}

TYPED_TEST(ClockContract, DoesNotWaitForADeadlineThatHasPassed) {
  EXPECT_FALSE(this->waitUntil(this->clock.now() - 1h));
  EXPECT_FALSE(this->waitUntil(this->clock.now()));
}

TYPED_TEST(ClockContract, ReturnsWhenReadyBeforeTheDeadline) {
  std::thread other([this] { this->makeReady(); });
  EXPECT_TRUE(this->waitUntil(this->clock.now() + 1h));
  other.join();
}

TYPED_TEST(ClockContract, WaitsForeverWithoutADeadline) {
  std::thread other([this] { this->makeReady(); });
  EXPECT_TRUE(this->waitUntil(kForever));
  other.join();
}

TEST(SystemClock, ReturnsWhenTheDeadlineIsReached) {
  SystemClock clock;
  std::mutex mutex;
  std::condition_variable condition;
  std::unique_lock lock(mutex);
  const TimePoint deadline = clock.now() + 1ms;
  EXPECT_FALSE(clock.wait(condition, lock, deadline, [] { return false; }));
  EXPECT_GE(clock.now(), deadline);
}

}  // namespace
}  // namespace appsync::test
