#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "base/SerialQueue.h"
#include "kit/fakes/Gate.h"

namespace appsync::test {
namespace {

TEST(SerialQueue, HasALabel) {
  EXPECT_EQ(SerialQueue("com.corvel.qor.Zephtra.AppSync").label(), "com.corvel.qor.Zephtra.AppSync");
}

TEST(SerialQueue, RunsWorkOnTheCallingThreadAndReturnsItsResult) {
  SerialQueue queue("q");
  std::thread::id runner;
  const std::unique_ptr<int> result = queue.sync([&] {
    runner = std::this_thread::get_id();
    return std::make_unique<int>(4);
  });
  EXPECT_EQ(*result, 4);
  EXPECT_EQ(runner, std::this_thread::get_id());
}

TEST(SerialQueue, PassesReferencesOn) {
  SerialQueue queue("q");
  int number = 0;
  static_assert(std::is_same_v<decltype(queue.sync([&]() -> int& { return number; })), int&>);
  queue.sync([&]() -> int& { return number; }) = 5;
  EXPECT_EQ(number, 5);
}

TEST(SerialQueue, RunsWorkThatCannotBeCopied) {
  SerialQueue queue("q");
  EXPECT_EQ(queue.sync([number = std::make_unique<int>(7)] { return *number; }), 7);
}

TEST(SerialQueue, PassesExceptionsOnAndStaysUsable) {
  SerialQueue queue("q");
  EXPECT_THROW(queue.sync([] { throw std::runtime_error("work"); }), std::runtime_error);
  EXPECT_FALSE(queue.isCurrent());
  EXPECT_EQ(queue.sync([] { return 1; }), 1);
}

TEST(SerialQueue, IsCurrentInsideItsWorkOnly) {
  SerialQueue queue("q");
  SerialQueue other("other");
  EXPECT_FALSE(queue.isCurrent());
  queue.sync([&] {
    EXPECT_TRUE(queue.isCurrent());
    EXPECT_FALSE(other.isCurrent());
    std::thread([&] { EXPECT_FALSE(queue.isCurrent()); }).join();
  });
  EXPECT_FALSE(queue.isCurrent());
}

TEST(SerialQueue, ThrowsOnReentryWithItsLabel) {
  SerialQueue queue("com.corvel.qor.Zephtra.AppRestore");
  bool inner = false;
  try {
    queue.sync([&] { queue.sync([&] { inner = true; }); });
    ADD_FAILURE() << "re-entry went unnoticed";
  } catch (const std::logic_error& error) {
    EXPECT_EQ(std::string(error.what()), "com.corvel.qor.Zephtra.AppRestore: work on this queue would wait for itself");
  }
  EXPECT_FALSE(inner);
  EXPECT_EQ(queue.sync([] { return 1; }), 1);
}

TEST(SerialQueue, ThrowsOnReentryThroughAnotherQueue) {
  SerialQueue queue("outer");
  SerialQueue other("inner");
  EXPECT_THROW(queue.sync([&] { other.sync([&] { queue.sync([] {}); }); }), std::logic_error);
  EXPECT_FALSE(queue.isCurrent());
  EXPECT_FALSE(other.isCurrent());
}

TEST(SerialQueue, RunsWorkOfSeveralThreadsOneAtATime) {
  SerialQueue queue("q");
  constexpr int kRounds = 500;
  int unguarded = 0;
  std::vector<std::thread> threads(4);
  for (std::thread& thread : threads) {
    thread = std::thread([&] {
      for (int round = 0; round < kRounds; ++round)
        queue.sync([&] { ++unguarded; });
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(unguarded, 4 * kRounds);
}

TEST(SerialQueue, RunsThreadsInTheOrderOfSubmission) {
  SerialQueue queue("q");
  Gate gate;
  gate.close();
  std::vector<int> order;
  std::vector<std::thread> threads;
  threads.emplace_back([&] { queue.sync([&] { gate.pass(); }); });
  gate.waitUntilStopped(1);
  for (int i = 0; i < 5; ++i) {
    threads.emplace_back([&, i] { queue.sync([&order, i] { order.push_back(i); }); });
    while (queue.waiting() != threads.size() - 1)
      std::this_thread::yield();
  }
  gate.open();
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(order, (std::vector{0, 1, 2, 3, 4}));
  EXPECT_EQ(queue.waiting(), 0u);
}

TEST(SerialQueue, ResubmittingThreadQueuesBehindWaiters) {
  SerialQueue queue("q");
  std::vector<std::string> order;
  std::thread other;
  queue.sync([&] {
    other = std::thread([&] { queue.sync([&] { order.emplace_back("waiting"); }); });
    while (queue.waiting() != 1)
      std::this_thread::yield();
  });
  queue.sync([&] { order.emplace_back("again"); });
  other.join();
  EXPECT_EQ(order, (std::vector<std::string>{"waiting", "again"}));
}

}  // namespace
}  // namespace appsync::test
