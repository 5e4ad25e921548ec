#include "kit/contracts/TimeContract.h"

#include <atomic>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include "kit/contracts/EventCounter.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

using std::chrono::milliseconds;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(TimeContract);

TEST_P(TimeContract, ClockIsMonotonic) {
  TimePoint last = subject().clock().now();
  for (int round = 0; round < 1000; ++round) {
    const TimePoint now = subject().clock().now();
    ASSERT_GE(now, last);
    last = now;
  }
}

TEST_P(TimeContract, ReadyConditionReturnsAtOnce) {
  std::mutex mutex;
  std::condition_variable condition;
  std::unique_lock lock(mutex);
  EXPECT_TRUE(subject().clock().wait(condition, lock, TimePoint::min(), [] { return true; }));
  EXPECT_TRUE(lock.owns_lock());
}

TEST_P(TimeContract, WaitEndsAtItsDeadline) {
  std::mutex mutex;
  std::condition_variable condition;
  std::unique_lock lock(mutex);
  EXPECT_FALSE(subject().clock().wait(condition, lock, subject().clock().now(), [] { return false; }));
  EXPECT_TRUE(lock.owns_lock());
}

TEST_P(TimeContract, WaitWithoutDeadlineEndsWhenNotified) {
  std::mutex mutex;
  std::condition_variable condition;
  bool isReady = false;
  std::jthread notifier([&] {
    const std::scoped_lock lock(mutex);
    isReady = true;
    condition.notify_all();
  });
  std::unique_lock lock(mutex);
  EXPECT_TRUE(subject().clock().wait(condition, lock, kForever, [&] { return isReady; }));
}

TEST_P(TimeContract, TaskRunsWhenItIsDue) {
  EventCounter runs;
  const TimePoint due = subject().clock().now() + milliseconds(2);
  TimePoint ran;
  subject().scheduler().after(milliseconds(2), [&] {
    ran = subject().clock().now();
    runs.add();
  });
  subject().pass(milliseconds(2));
  ASSERT_TRUE(runs.waitFor(1));
  EXPECT_GE(ran, due);
}

TEST_P(TimeContract, TaskNeverRunsInsideTheCall) {
  EventCounter runs;
  std::atomic<bool> hasReturned = false;
  std::mutex mutex;
  std::unique_lock lock(mutex);
  subject().scheduler().after(milliseconds(0), [&] {
    { const std::scoped_lock waitForTheCall(mutex); }  // Released before the test ends.
    EXPECT_TRUE(hasReturned);
    runs.add();
  });
  hasReturned = true;
  lock.unlock();
  subject().pass(milliseconds(0));
  EXPECT_TRUE(runs.waitFor(1));
}

TEST_P(TimeContract, TasksRunInOrderOfDueTimeThenOfCalls) {
  EventCounter runs;
  std::vector<int> order;
  const auto task = [&](int number) {
    return [&, number] {
      order.push_back(number);
      runs.add();
    };
  };
  subject().scheduler().after(milliseconds(40), task(3));
  subject().scheduler().after(milliseconds(1), task(1));
  subject().scheduler().after(milliseconds(1), task(2));
  subject().pass(milliseconds(40));
  ASSERT_TRUE(runs.waitFor(3));
  EXPECT_EQ(order, (std::vector<int>{1, 2, 3}));
}

TEST_P(TimeContract, TaskCanScheduleATask) {
  EventCounter runs;
  subject().scheduler().after(milliseconds(1),
                              [&] { subject().scheduler().after(milliseconds(1), [&] { runs.add(); }); });
  subject().pass(milliseconds(2));
  EXPECT_TRUE(runs.waitFor(1));
}

TEST_P(TimeContract, NonPositiveDelayMeansAtOnce) {
  EventCounter runs;
  subject().scheduler().after(milliseconds(-5), [&] { runs.add(); });
  subject().pass(milliseconds(0));
  EXPECT_TRUE(runs.waitFor(1));
}

TEST_P(TimeContract, TaskIsDestroyedRightAfterItRan) {
  EventCounter runs;
  auto held = std::make_shared<int>(0);
  const std::weak_ptr<int> watched = held;
  subject().scheduler().after(milliseconds(0), [held = std::move(held)] {});
  subject().scheduler().after(milliseconds(0), [&] { runs.add(); });
  subject().pass(milliseconds(0));
  ASSERT_TRUE(runs.waitFor(1));
  EXPECT_TRUE(watched.expired());
}

TEST_P(TimeContract, SchedulesConcurrently) {
  EventCounter runs;
  runOnThreads(8, [&](std::size_t) { subject().scheduler().after(milliseconds(1), [&] { runs.add(); }); });
  subject().pass(milliseconds(1));
  EXPECT_TRUE(runs.waitFor(8));
}

}  // namespace appsync::test
