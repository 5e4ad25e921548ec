#include <atomic>
#include <memory>
#include <optional>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "base/Semaphore.h"
#include "base/SystemClock.h"
#include "base/ThreadScheduler.h"
#include "base/VirtualTime.h"
#include "kit/fakes/Gate.h"
#include "tests/support/AtEnd.h"

namespace appsync::test {
namespace {

using namespace std::chrono_literals;

/// A scheduler whose clock moves when the test says so; what it does is signalled on the machine's clock.
class ThreadSchedulerTest : public testing::Test {
 protected:
  SystemClock clock;
  VirtualTime time;
  Semaphore ran{clock, 0};
  std::vector<int> order;
  std::optional<ThreadScheduler> scheduler{std::in_place, time};

  std::function<void()> record(int number) {
    return [this, number] {
      order.push_back(number);
      ran.signal();
    };
  }
};

TEST_F(ThreadSchedulerTest, MayBeDestroyedUnused) {
  scheduler.reset();
}

TEST_F(ThreadSchedulerTest, RunsTasksOnOneDedicatedThread) {
  std::vector<std::thread::id> runners;
  for (int i = 0; i < 3; ++i) {
    scheduler->after(0s, [&] {
      runners.push_back(std::this_thread::get_id());
      ran.signal();
    });
    ran.wait();
  }
  ASSERT_EQ(runners.size(), 3u);
  EXPECT_NE(runners[0], std::this_thread::get_id());
  EXPECT_EQ(runners[0], runners[1]);
  EXPECT_EQ(runners[1], runners[2]);
}

TEST_F(ThreadSchedulerTest, RunsTaskExactlyAfterItsDelay) {
  scheduler->after(30s, record(1));
  time.waitUntilWaiting(1);
  time.advance(30s - 1ns);
  time.waitUntilWaiting(1);
  EXPECT_FALSE(ran.wait(clock.now()));
  time.advance(1ns);
  EXPECT_TRUE(ran.wait());
}

TEST_F(ThreadSchedulerTest, RunsTasksByDueTimeThenBySchedulingOrder) {
  Gate gate;
  gate.close();
  scheduler->after(0s, [&] { gate.pass(); });
  gate.waitUntilStopped(1);
  scheduler->after(30s, record(4));
  scheduler->after(10s, record(2));
  scheduler->after(20s, record(3));
  scheduler->after(10s, record(2));
  scheduler->after(0s, record(0));
  scheduler->after(-1s, record(1));
  time.advance(30s);
  gate.open();
  for (int i = 0; i < 6; ++i)
    EXPECT_TRUE(ran.wait());
  EXPECT_EQ(order, (std::vector{0, 1, 2, 2, 3, 4}));
}

TEST_F(ThreadSchedulerTest, EarlierTaskOvertakesAwaitedOne) {
  scheduler->after(1h, record(2));
  time.waitUntilWaiting(1);
  scheduler->after(1s, record(1));
  time.advance(1s);
  EXPECT_TRUE(ran.wait());
  EXPECT_EQ(order, (std::vector{1}));
}

TEST_F(ThreadSchedulerTest, AcceptsDelayBeyondTheEndOfTime) {
  scheduler->after(Duration::max(), record(1));
  scheduler->after(0s, record(2));
  EXPECT_TRUE(ran.wait());
  EXPECT_EQ(order, (std::vector{2}));
}

TEST_F(ThreadSchedulerTest, TasksMayScheduleTasks) {
  scheduler->after(0s, [this] {
    scheduler->after(0s, record(2));
    record(1)();
  });
  EXPECT_TRUE(ran.wait() && ran.wait());
  EXPECT_EQ(order, (std::vector{1, 2}));
}

TEST_F(ThreadSchedulerTest, DestroysATaskRightAfterItRan) {
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watch = captured;
  bool gone = false;
  scheduler->after(0s, [captured = std::move(captured)] {});
  scheduler->after(0s, [&] {
    gone = watch.expired();
    ran.signal();
  });
  ran.wait();
  EXPECT_TRUE(gone);
}

TEST_F(ThreadSchedulerTest, DestructorDropsTasksNotDue) {
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watch = captured;
  scheduler->after(1s, [captured = std::move(captured)] { ADD_FAILURE() << "ran"; });
  scheduler.reset();
  EXPECT_TRUE(watch.expired());
}

TEST_F(ThreadSchedulerTest, CloseDropsTasksNotDueAndLaterOnes) {
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watch = captured;
  scheduler->after(1s, [captured = std::move(captured)] { ADD_FAILURE() << "ran"; });
  scheduler->close();
  EXPECT_TRUE(watch.expired());
  auto late = std::make_shared<int>();
  const std::weak_ptr<int> watchLate = late;
  scheduler->after(0s, [late = std::move(late)] { ADD_FAILURE() << "ran"; });
  EXPECT_TRUE(watchLate.expired());
  scheduler->close();
}

TEST_F(ThreadSchedulerTest, DestructorWaitsForRunningAndDueTasks) {
  Gate gate;
  gate.close();
  scheduler->after(0s, [&] {
    gate.pass();
    record(1)();
  });
  gate.waitUntilStopped(1);
  scheduler->after(0s, record(2));
  scheduler->after(1s, record(3));
  std::thread opener([&] { gate.open(); });
  scheduler.reset();
  EXPECT_EQ(order, (std::vector{1, 2}));
  opener.join();
}

TEST_F(ThreadSchedulerTest, DropsTasksScheduledDuringDestruction) {
  Gate gate;
  gate.close();
  scheduler->after(0s, [&] {
    gate.pass();
    scheduler->after(0s, record(1));
  });
  gate.waitUntilStopped(1);
  scheduler->after(1s, [opener = std::make_shared<AtEnd>([&] { gate.open(); })] {});
  scheduler.reset();
  EXPECT_TRUE(order.empty());
}

TEST_F(ThreadSchedulerTest, DestructorOfDroppedCaptureMaySchedule) {
  scheduler->after(1s, [last = std::make_shared<AtEnd>([this] { scheduler->after(0s, record(1)); })] {});
  scheduler.reset();
  EXPECT_TRUE(order.empty());
}

TEST_F(ThreadSchedulerTest, MayBeDestroyedByItsOwnTask) {
  const auto done = std::make_shared<Semaphore>(clock, 0);
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watch = captured;
  auto owner = std::make_shared<ThreadScheduler>(time);
  ThreadScheduler& reference = *owner;
  reference.after(1h, [captured = std::move(captured)] { ADD_FAILURE() << "ran"; });
  reference.after(0s, [&, done, owner = std::move(owner)]() mutable {
    owner.reset();
    EXPECT_TRUE(watch.expired());
    done->signal();
  });
  EXPECT_TRUE(done->wait());
}

TEST_F(ThreadSchedulerTest, MayBeDestroyedWithACaptureOfItsTask) {
  for (int round = 0; round < 100; ++round) {
    const auto done = std::make_shared<Semaphore>(clock, 0);
    Gate gate;
    gate.close();
    auto owner = std::make_shared<ThreadScheduler>(time);
    const std::weak_ptr<ThreadScheduler> watch = owner;
    owner->after(0s, [&gate, owner] { gate.pass(); });
    owner->after(0s, [done] { done->signal(); });
    owner.reset();
    gate.open();
    EXPECT_TRUE(done->wait());
    EXPECT_TRUE(watch.expired());
  }
}

TEST_F(ThreadSchedulerTest, DestroyedOnOwnThreadRunsDueTasks) {
  const auto done = std::make_shared<Semaphore>(clock, 0);
  Gate gate;
  gate.close();
  auto owner = std::make_shared<ThreadScheduler>(time);
  ThreadScheduler& reference = *owner;
  reference.after(0s, [this, &gate, done, owner = std::move(owner)]() mutable {
    gate.pass();
    owner.reset();
    order.push_back(2);
    done->signal();
  });
  gate.waitUntilStopped(1);
  reference.after(0s, [this] { order.push_back(1); });
  gate.open();
  EXPECT_TRUE(done->wait());
  EXPECT_EQ(order, (std::vector{1, 2}));
}

TEST_F(ThreadSchedulerTest, WorksWithTheSystemClock) {
  ThreadScheduler real(clock);
  real.after(1h, record(2));
  real.after(1ms, record(1));
  EXPECT_TRUE(ran.wait());
  EXPECT_EQ(order, (std::vector{1}));
}

TEST_F(ThreadSchedulerTest, TakesTasksFromManyThreads) {
  constexpr int kTasks = 100;
  std::atomic<int> count = 0;
  std::vector<std::thread> threads(4);
  for (std::thread& thread : threads) {
    thread = std::thread([&] {
      for (int task = 0; task < kTasks; ++task)
        scheduler->after(0s, [&] { ++count; });
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  scheduler.reset();
  EXPECT_EQ(count, 4 * kTasks);
}

}  // namespace
}  // namespace appsync::test
