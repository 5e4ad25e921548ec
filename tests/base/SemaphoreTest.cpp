#include <atomic>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "base/Semaphore.h"
#include "base/SystemClock.h"
#include "base/VirtualTime.h"

namespace appsync::test {
namespace {

using namespace std::chrono_literals;

TEST(Semaphore, InitialCountNeedsNoSignal) {
  VirtualTime time;
  Semaphore semaphore(time, 2);
  EXPECT_TRUE(semaphore.wait());
  EXPECT_TRUE(semaphore.wait(time.now()));
  EXPECT_FALSE(semaphore.wait(time.now()));
}

TEST(Semaphore, EachSignalEndsOneWait) {
  VirtualTime time;
  Semaphore semaphore(time, 0);
  semaphore.signal();
  semaphore.signal();
  EXPECT_TRUE(semaphore.wait());
  EXPECT_TRUE(semaphore.wait());
  EXPECT_FALSE(semaphore.wait(time.now()));
}

TEST(Semaphore, WaitsForASignalOfAnotherThread) {
  VirtualTime time;
  Semaphore semaphore(time, 0);
  std::thread waiter([&] { EXPECT_TRUE(semaphore.wait(time.now() + 60s)); });
  time.waitUntilWaiting(1);
  semaphore.signal();
  waiter.join();
}

TEST(Semaphore, WaitEndsAtDeadlineAndLosesNoSignal) {
  VirtualTime time;
  Semaphore semaphore(time, 0);
  std::thread waiter([&] { EXPECT_FALSE(semaphore.wait(time.now() + 60s)); });
  time.waitUntilWaiting(1);
  time.advance(60s);
  waiter.join();
  semaphore.signal();
  EXPECT_TRUE(semaphore.wait(time.now()));
}

TEST(Semaphore, OneSignalWakesOneOfSeveralWaiters) {
  VirtualTime time;
  Semaphore semaphore(time, 0);
  std::atomic<int> let = 0;
  std::vector<std::thread> waiters(3);
  for (std::thread& waiter : waiters) {
    waiter = std::thread([&] { let += semaphore.wait(TimePoint() + 60s) ? 1 : 0; });
  }
  time.waitUntilWaiting(3);
  semaphore.signal();
  time.advance(60s);
  for (std::thread& waiter : waiters)
    waiter.join();
  EXPECT_EQ(let, 1);
}

TEST(Semaphore, MayBeDestroyedRightAfterItsWait) {
  SystemClock clock;
  for (int round = 0; round < 500; ++round) {
    auto semaphore = std::make_unique<Semaphore>(clock, 0);
    std::thread other([signalling = semaphore.get()] { signalling->signal(); });
    EXPECT_TRUE(semaphore->wait());
    semaphore.reset();
    other.join();
  }
}

TEST(Semaphore, MayBeDestroyedRightAfterABoundedWait) {
  VirtualTime time;
  for (int round = 0; round < 200; ++round) {
    auto semaphore = std::make_unique<Semaphore>(time, 0);
    std::thread other([signalling = semaphore.get()] { signalling->signal(); });
    EXPECT_TRUE(semaphore->wait(time.now() + 1s));
    semaphore.reset();
    other.join();
  }
}

}  // namespace
}  // namespace appsync::test
