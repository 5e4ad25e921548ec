#include <atomic>
#include <cstddef>
#include <filesystem>
#include <functional>
#include <iterator>
#include <memory>
#include <set>
#include <stdexcept>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "base/Group.h"
#include "base/OperationQueue.h"
#include "base/Semaphore.h"
#include "base/SystemClock.h"
#include "kit/fakes/Gate.h"
#include "tests/support/AtEnd.h"
#include "tests/support/NoMoreThreads.h"

namespace appsync::test {
namespace {

class OperationQueueTest : public testing::Test {
 protected:
  SystemClock clock;
};

std::ptrdiff_t threadsOfThisProcess() {
  return std::distance(std::filesystem::directory_iterator("/proc/self/task"), std::filesystem::directory_iterator());
}

TEST_F(OperationQueueTest, ReturnsItsMaximum) {
  EXPECT_EQ(OperationQueue(10).maxConcurrentOperations(), 10u);
}

TEST_F(OperationQueueTest, RefusesMaximumOfZero) {
  EXPECT_THROW(OperationQueue(0), std::invalid_argument);
}

TEST_F(OperationQueueTest, MayBeDestroyedUnused) {
  const OperationQueue queue(10);
}

TEST_F(OperationQueueTest, RunsOperationsOnAnotherThread) {
  std::thread::id runner;
  {
    OperationQueue queue(1);
    queue.add([&] { runner = std::this_thread::get_id(); });
  }
  EXPECT_NE(runner, std::thread::id());
  EXPECT_NE(runner, std::this_thread::get_id());
}

TEST_F(OperationQueueTest, StartsOperationsInTheOrderOfAdding) {
  std::vector<int> order;
  {
    OperationQueue queue(1);
    for (int i = 0; i < 100; ++i)
      queue.add([&order, i] { order.push_back(i); });
  }
  ASSERT_EQ(order.size(), 100u);
  for (int i = 0; i < 100; ++i)
    EXPECT_EQ(order[static_cast<std::size_t>(i)], i);
}

TEST_F(OperationQueueTest, RunsAtMostItsMaximumAtOnce) {
  Gate gate;
  gate.close();
  std::atomic<int> begun = 0;
  OperationQueue queue(3);
  for (int i = 0; i < 10; ++i) {
    queue.add([&] {
      ++begun;
      gate.pass();
    });
  }
  gate.waitUntilStopped(3);
  EXPECT_EQ(begun, 3);
  gate.open();
}

TEST_F(OperationQueueTest, StartsThreadsOnDemand) {
  // Threads that an earlier test left to end by themselves may lower the count, never raise it.
  const std::ptrdiff_t before = threadsOfThisProcess();
  Gate gate;
  gate.close();
  OperationQueue queue(10);
  EXPECT_LE(threadsOfThisProcess(), before);
  queue.add([&] { gate.pass(); });
  gate.waitUntilStopped(1);
  EXPECT_LE(threadsOfThisProcess(), before + 1);
  queue.add([&] { gate.pass(); });
  gate.waitUntilStopped(2);
  EXPECT_LE(threadsOfThisProcess(), before + 2);
  gate.open();
}

TEST_F(OperationQueueTest, ContinuesIfNoFurtherThreadStarts) {
  if (!NoMoreThreads::arePossible()) GTEST_SKIP() << "this build starts threads in its own way";
  std::atomic<int> ran = 0;
  Gate gate;
  gate.close();
  {
    OperationQueue queue(10);
    queue.add([&] { gate.pass(); });
    gate.waitUntilStopped(1);
    const NoMoreThreads none;
    for (int i = 0; i < 5; ++i)
      queue.add([&] { ++ran; });
    gate.open();
  }
  EXPECT_EQ(ran, 5);
}

TEST_F(OperationQueueTest, AddThrowsIfNoThreadStarts) {
  if (!NoMoreThreads::arePossible()) GTEST_SKIP() << "this build starts threads in its own way";
  bool ran = false;
  {
    OperationQueue queue(10);
    {
      const NoMoreThreads none;
      EXPECT_THROW(queue.add([&] { ran = true; }), std::system_error);
    }
    queue.add([] {});
  }
  EXPECT_FALSE(ran);
}

TEST_F(OperationQueueTest, ReusesIdleThreads) {
  constexpr int kOperations = 100;
  OperationQueue queue(kOperations);
  std::set<std::thread::id> runners;
  Semaphore ended(clock, 0);
  for (int i = 0; i < kOperations; ++i) {
    auto last = std::make_shared<AtEnd>([&] { ended.signal(); });
    queue.add([&runners, last = std::move(last)] { runners.insert(std::this_thread::get_id()); });
    EXPECT_TRUE(ended.wait());
  }
  // A thread is idle only a moment after its operation has ended, so there may be more than one.
  EXPECT_LT(runners.size(), kOperations / 2u);
}

TEST_F(OperationQueueTest, RunningOperationDoesNotDelayOthers) {
  Gate gate;
  gate.close();
  Semaphore ran(clock, 0);
  OperationQueue queue(2);
  queue.add([&] { gate.pass(); });
  gate.waitUntilStopped(1);
  for (int i = 0; i < 10; ++i)
    queue.add([&] { ran.signal(); });
  for (int i = 0; i < 10; ++i)
    EXPECT_TRUE(ran.wait());
  gate.open();
}

TEST_F(OperationQueueTest, OperationsMayAddOperations) {
  std::atomic<int> ran = 0;
  Group group(clock);
  OperationQueue queue(2);
  group.enter();
  queue.add([&] {
    ++ran;
    queue.add([&] {
      ++ran;
      group.leave();
    });
  });
  group.wait();
  EXPECT_EQ(ran, 2);
}

TEST_F(OperationQueueTest, OperationsMayAddDuringDestruction) {
  std::atomic<int> ran = 0;
  {
    OperationQueue queue(1);
    queue.add([&] {
      for (int i = 0; i < 5; ++i)
        queue.add([&] { ++ran; });
    });
  }
  EXPECT_EQ(ran, 5);
}

TEST_F(OperationQueueTest, DestroysOperationBeforeTheNextRuns) {
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watch = captured;
  bool aliveInside = false;
  bool goneBeforeNext = false;
  {
    OperationQueue queue(1);
    queue.add([&, captured = std::move(captured)] { aliveInside = !watch.expired(); });
    queue.add([&] { goneBeforeNext = watch.expired(); });
  }
  EXPECT_TRUE(aliveInside);
  EXPECT_TRUE(goneBeforeNext);
}

TEST_F(OperationQueueTest, DestructorOfCaptureMayAddOperations) {
  Semaphore ran(clock, 0);
  OperationQueue queue(1);
  queue.add([last = std::make_shared<AtEnd>([&] { queue.add([&] { ran.signal(); }); })] {});
  EXPECT_TRUE(ran.wait());
}

TEST_F(OperationQueueTest, DestructorWaitsForAllOperations) {
  Gate gate;
  gate.close();
  std::atomic<int> ran = 0;
  auto queue = std::make_unique<OperationQueue>(2);
  for (int i = 0; i < 6; ++i) {
    queue->add([&] {
      gate.pass();
      ++ran;
    });
  }
  gate.waitUntilStopped(2);
  std::thread opener([&] { gate.open(); });
  queue.reset();
  EXPECT_EQ(ran, 6);
  opener.join();
}

/// Owns a queue as the plug-in object does: queued operations keep it alive.
struct Owner {
  OperationQueue queue{4};
  std::shared_ptr<Semaphore> destroyed;
  std::shared_ptr<std::thread::id> destroyer;

  ~Owner() {
    *destroyer = std::this_thread::get_id();
    destroyed->signal();
  }
};

TEST_F(OperationQueueTest, LastOwnerMayBeAnOperation) {
  for (int round = 0; round < 100; ++round) {
    auto owner = std::make_shared<Owner>();
    const auto destroyed = owner->destroyed = std::make_shared<Semaphore>(clock, 0);
    const auto destroyer = owner->destroyer = std::make_shared<std::thread::id>();
    Gate gate;
    gate.close();
    owner->queue.add([&gate, owner] { gate.pass(); });
    owner.reset();
    gate.open();
    EXPECT_TRUE(destroyed->wait());
    EXPECT_NE(*destroyer, std::this_thread::get_id());
  }
}

TEST_F(OperationQueueTest, LastOwnerMayBeAnyOfSeveralOperations) {
  for (int round = 0; round < 100; ++round) {
    auto owner = std::make_shared<Owner>();
    const auto destroyed = owner->destroyed = std::make_shared<Semaphore>(clock, 0);
    owner->destroyer = std::make_shared<std::thread::id>();
    for (int i = 0; i < 8; ++i)
      owner->queue.add([owner] {});
    owner.reset();
    EXPECT_TRUE(destroyed->wait());
  }
}

TEST_F(OperationQueueTest, RunningOperationMayReleaseLastOwner) {
  Semaphore done(clock, 0);
  auto queue = std::make_shared<OperationQueue>(1);
  OperationQueue& reference = *queue;
  reference.add([&, queue = std::move(queue)]() mutable {
    queue.reset();
    done.signal();
  });
  EXPECT_TRUE(done.wait());
}

TEST_F(OperationQueueTest, DestroyedOnOwnThreadRunsQueuedOperations) {
  Gate gate;
  gate.close();
  const auto ran = std::make_shared<Semaphore>(clock, 0);
  auto queue = std::make_shared<OperationQueue>(1);
  OperationQueue& reference = *queue;
  reference.add([&gate, queue = std::move(queue)] { gate.pass(); });
  for (int i = 0; i < 3; ++i)
    reference.add([ran] { ran->signal(); });
  gate.open();
  for (int i = 0; i < 3; ++i)
    EXPECT_TRUE(ran->wait());
}

TEST_F(OperationQueueTest, DestroyedOnOwnThreadDoesNotWait) {
  Gate gate;
  gate.close();
  const auto done = std::make_shared<Semaphore>(clock, 0);
  const auto otherDone = std::make_shared<Semaphore>(clock, 0);
  auto queue = std::make_shared<OperationQueue>(2);
  OperationQueue& reference = *queue;
  reference.add([&gate, otherDone] {
    gate.pass();
    otherDone->signal();
  });
  gate.waitUntilStopped(1);
  auto last = std::make_shared<AtEnd>([done] { done->signal(); });
  reference.add([last = std::move(last), queue = std::move(queue)] {});
  EXPECT_TRUE(done->wait());
  gate.open();
  EXPECT_TRUE(otherDone->wait());
}

using OperationQueueDeathTest = OperationQueueTest;

TEST_F(OperationQueueDeathTest, ThrowingOperationEndsTheProgram) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_DEATH(OperationQueue(1).add([] { throw std::runtime_error("operation"); }), "operation");
}

}  // namespace
}  // namespace appsync::test
