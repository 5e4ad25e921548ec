#include <atomic>
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "base/Semaphore.h"
#include "base/VirtualTime.h"
#include "kit/fakes/Gate.h"

namespace appsync::test {
namespace {

using namespace std::chrono_literals;

class VirtualTimeTest : public testing::Test {
 protected:
  std::function<void()> record(std::string name) {
    return [this, name = std::move(name)] { ran.emplace_back(name, time.now() - start); };
  }

  using Runs = std::vector<std::pair<std::string, Duration>>;

  Runs ran;
  VirtualTime time;
  const TimePoint start = time.now();
};

TEST_F(VirtualTimeTest, AdvancesOnRequestOnly) {
  EXPECT_EQ(time.now(), start);
  time.advance(3s);
  EXPECT_EQ(time.now(), start + 3s);
  time.advance(0s);
  EXPECT_EQ(time.now(), start + 3s);
}

TEST_F(VirtualTimeTest, IsMonotonic) {
  time.advance(-5s);
  EXPECT_EQ(time.now(), start);
}

TEST_F(VirtualTimeTest, NeverRunsTaskDuringAfter) {
  time.after(0s, record("now"));
  EXPECT_TRUE(ran.empty());
  time.advance(0s);
  EXPECT_EQ(ran, (Runs{{"now", 0s}}));
}

TEST_F(VirtualTimeTest, RunsTasksInOrderAtTheirDueTimes) {
  time.after(30s, record("third"));
  time.after(10s, record("first"));
  time.after(20s, record("second"));
  time.advance(1min);
  EXPECT_EQ(ran, (Runs{{"first", 10s}, {"second", 20s}, {"third", 30s}}));
  EXPECT_EQ(time.now(), start + 1min);
}

TEST_F(VirtualTimeTest, RunsSimultaneousTasksInSchedulingOrder) {
  time.after(10s, record("a"));
  time.after(10s, record("b"));
  time.advance(5s);
  time.after(5s, record("c"));
  time.advance(5s);
  EXPECT_EQ(ran, (Runs{{"a", 10s}, {"b", 10s}, {"c", 10s}}));
}

TEST_F(VirtualTimeTest, RunsTaskExactlyAtItsDueTime) {
  time.after(30s, record("retry"));
  time.advance(30s - 1ns);
  EXPECT_TRUE(ran.empty());
  time.advance(1ns);
  EXPECT_EQ(ran, (Runs{{"retry", 30s}}));
}

TEST_F(VirtualTimeTest, RunsATaskOnce) {
  time.after(1s, record("once"));
  time.advance(1s);
  time.advance(1h);
  EXPECT_EQ(ran.size(), 1u);
}

TEST_F(VirtualTimeTest, TreatsNonPositiveDelayAsZero) {
  time.advance(10s);
  time.after(0s, record("at once"));
  time.after(-5s, record("late"));
  time.advance(1s);
  EXPECT_EQ(ran, (Runs{{"at once", 10s}, {"late", 10s}}));
}

TEST_F(VirtualTimeTest, AcceptsDelaysBeyondTheEndOfTime) {
  time.advance(10s);
  time.after(Duration::max(), record("never"));
  EXPECT_EQ(time.nextDue(), kForever);
  time.advance(1h);
  EXPECT_TRUE(ran.empty());
}

TEST_F(VirtualTimeTest, RunsTasksOfTasksInTheSameAdvance) {
  time.after(10s, [this] {
    record("outer")();
    time.after(0s, record("at once"));
    time.after(5s, record("later"));
    time.after(1h, record("much later"));
  });
  time.after(12s, record("between"));
  time.advance(20s);
  EXPECT_EQ(ran, (Runs{{"outer", 10s}, {"at once", 10s}, {"between", 12s}, {"later", 15s}}));
  EXPECT_EQ(time.pendingTasks(), 1u);
}

TEST_F(VirtualTimeTest, DestroysATaskRightAfterItRan) {
  auto captured = std::make_shared<int>();
  std::weak_ptr<int> watch = captured;
  time.after(1s, [captured = std::move(captured)] {});
  bool gone = false;
  time.after(1s, [&] { gone = watch.expired(); });
  time.advance(1s);
  EXPECT_TRUE(gone);
}

TEST_F(VirtualTimeTest, DestructorDropsPendingTasks) {
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watch = captured;
  {
    VirtualTime other;
    other.after(1s, [captured = std::move(captured)] { ADD_FAILURE() << "ran"; });
  }
  EXPECT_TRUE(watch.expired());
}

TEST_F(VirtualTimeTest, RefusesToAdvanceInsideATask) {
  bool refused = false;
  time.after(1s, [&] {
    try {
      time.advance(1s);
    } catch (const std::logic_error&) {
      refused = true;
    }
  });
  time.advance(1s);
  EXPECT_TRUE(refused);
}

TEST_F(VirtualTimeTest, AdvancePassesExceptionsOn) {
  time.after(1s, [] { throw std::runtime_error("task"); });
  time.after(2s, record("next"));
  EXPECT_THROW(time.advance(1min), std::runtime_error);
  EXPECT_EQ(time.now(), start + 1s);
  EXPECT_TRUE(ran.empty());
  time.advance(1min);
  EXPECT_EQ(ran, (Runs{{"next", 2s}}));
}

TEST_F(VirtualTimeTest, ReportsPendingTasks) {
  EXPECT_EQ(time.pendingTasks(), 0u);
  EXPECT_EQ(time.nextDue(), std::nullopt);
  time.after(30s, record("b"));
  time.after(10s, record("a"));
  EXPECT_EQ(time.pendingTasks(), 2u);
  EXPECT_EQ(time.nextDue(), start + 10s);
  time.advance(10s);
  EXPECT_EQ(time.pendingTasks(), 1u);
  EXPECT_EQ(time.nextDue(), start + 30s);
}

TEST_F(VirtualTimeTest, WaitsUntilOtherThreadsHaveScheduled) {
  std::thread other([this] {
    time.after(1s, record("a"));
    time.after(2s, record("b"));
  });
  time.waitUntilScheduled(2);
  EXPECT_EQ(time.pendingTasks(), 2u);
  time.advance(2s);
  EXPECT_EQ(ran.size(), 2u);
  other.join();
}

TEST_F(VirtualTimeTest, WakesWaiterExactlyAtItsDeadline) {
  Semaphore semaphore(time, 0);
  std::optional<TimePoint> woken;
  std::thread waiter([&] {
    EXPECT_FALSE(semaphore.wait(start + 60s));
    woken = time.now();
  });
  time.waitUntilWaiting(1);
  time.advance(59s);
  time.waitUntilWaiting(1);
  time.advance(1s);
  waiter.join();
  EXPECT_EQ(woken, start + 60s);
}

TEST_F(VirtualTimeTest, WakesWaiterBeforeLaterTask) {
  Semaphore semaphore(time, 0);
  std::thread waiter([&] { EXPECT_FALSE(semaphore.wait(start + 1s)); });
  time.waitUntilWaiting(1);
  time.after(2s, [&] {
    waiter.join();
    record("joined")();
  });
  time.advance(1min);
  EXPECT_EQ(ran, (Runs{{"joined", 2s}}));
}

TEST_F(VirtualTimeTest, IgnoresNotificationBeforeReady) {
  std::mutex mutex;
  std::condition_variable condition;
  bool ready = false;
  const auto notify = [&](bool nowReady) {
    const std::lock_guard lock(mutex);
    ready = nowReady;
    condition.notify_all();
  };
  std::thread waiter([&] {
    std::unique_lock lock(mutex);
    EXPECT_TRUE(time.wait(condition, lock, start + 1s, [&] { return ready; }));
  });
  time.waitUntilWaiting(1);
  notify(false);
  time.waitUntilWaiting(1);
  notify(true);
  waiter.join();
}

TEST_F(VirtualTimeTest, WakesEachWaiterWhoseDeadlineIsReached) {
  std::vector<std::unique_ptr<Semaphore>> semaphores;
  std::vector<std::thread> waiters;
  for (int i = 1; i <= 4; ++i) {
    Semaphore& semaphore = *semaphores.emplace_back(std::make_unique<Semaphore>(time, 0));
    waiters.emplace_back([this, &semaphore, i] { EXPECT_EQ(semaphore.wait(start + i * 1s), i == 4); });
  }
  time.waitUntilWaiting(4);
  time.advance(3s);
  time.waitUntilWaiting(1);
  semaphores.back()->signal();
  for (std::thread& waiter : waiters)
    waiter.join();
}

TEST_F(VirtualTimeTest, DoesNotCountWaitersWithoutADeadline) {
  Semaphore unbounded(time, 0);
  Semaphore bounded(time, 0);
  std::atomic<bool> begun = false;
  std::thread forever([&] { EXPECT_TRUE(unbounded.wait()); });
  std::thread other([&] {
    begun = true;
    EXPECT_FALSE(bounded.wait(start + 1s));
  });
  time.waitUntilWaiting(1);
  EXPECT_TRUE(begun);
  time.advance(1s);
  other.join();
  unbounded.signal();
  forever.join();
}

TEST_F(VirtualTimeTest, DoesNotCountWaiterPastItsDeadline) {
  Gate gate;
  gate.close();
  std::mutex mutex;
  std::condition_variable condition;
  std::thread leaving([&] {
    std::unique_lock lock(mutex);
    EXPECT_FALSE(time.wait(condition, lock, start + 1s, [&] {
      if (time.now() > start) gate.pass();
      return false;
    }));
  });
  time.waitUntilWaiting(1);
  mutex.lock();  // Only now is it certain to sleep: it keeps the mutex until then, and at the gate.
  mutex.unlock();
  time.advance(1s);
  gate.waitUntilStopped(1);
  std::atomic<bool> begun = false;
  Semaphore semaphore(time, 0);
  std::thread other([&] {
    begun = true;
    EXPECT_TRUE(semaphore.wait(start + 2s));
  });
  time.waitUntilWaiting(1);
  EXPECT_TRUE(begun);
  semaphore.signal();
  other.join();
  gate.open();
  leaving.join();
}

TEST_F(VirtualTimeTest, WaiterMayDestroyItsConditionDuringAdvance) {
  for (int round = 0; round < 200; ++round) {
    const TimePoint deadline = time.now() + 1s;
    std::thread waiter([&] {
      auto semaphore = std::make_unique<Semaphore>(time, 0);
      EXPECT_FALSE(semaphore->wait(deadline));
    });
    time.waitUntilWaiting(1);
    time.advance(1s);
    waiter.join();
  }
}

TEST_F(VirtualTimeTest, SignalsRacingDeadlinesAreDeliveredOnce) {
  constexpr int kRounds = 200;
  Semaphore semaphore(time, 0);
  int taken = 0;
  std::atomic<bool> done = false;
  std::thread waiter([&] {
    for (int round = 0; round < kRounds; ++round)
      taken += semaphore.wait(time.now() + 1s) ? 1 : 0;
    done = true;
  });
  std::thread signaller([&] {
    for (int round = 0; round < kRounds; ++round)
      semaphore.signal();
  });
  while (!done)
    time.advance(1s);
  waiter.join();
  signaller.join();
  while (semaphore.wait(time.now()))
    ++taken;
  EXPECT_EQ(taken, kRounds);
}

TEST_F(VirtualTimeTest, SerialisesConcurrentAdvances) {
  for (int i = 1; i <= 100; ++i)
    time.after(i * 1s, [this, i] { EXPECT_EQ(time.now(), start + i * 1s); });
  std::thread other([this] { time.advance(50s); });
  time.advance(50s);
  other.join();
  EXPECT_EQ(time.now(), start + 100s);
  EXPECT_EQ(time.pendingTasks(), 0u);
}

}  // namespace
}  // namespace appsync::test
