#include <atomic>
#include <thread>

#include <gtest/gtest.h>

#include "kit/fakes/FakeCallbackThread.h"
#include "kit/fakes/Gate.h"

namespace appsync::test {
namespace {

TEST(FakeCallbackThread, RunsCallbacksOnItsOwnThread) {
  FakeCallbackThread thread;
  std::thread::id called;
  thread.post(thread.subscribe(), [&] { called = std::this_thread::get_id(); });
  thread.waitUntilIdle();
  EXPECT_NE(called, std::thread::id());
  EXPECT_NE(called, std::this_thread::get_id());
}

TEST(FakeCallbackThread, DropsCallbacksOfAnEndedSubscription) {
  FakeCallbackThread thread;
  const FakeCallbackThread::Subscription subscription = thread.subscribe();
  Gate gate;
  gate.close();
  std::atomic<int> calls = 0;
  thread.post(thread.subscribe(), [&] { gate.pass(); });
  thread.post(subscription, [&] { ++calls; });
  gate.waitUntilStopped(1);
  thread.unsubscribe(subscription);
  gate.open();
  thread.waitUntilIdle();
  EXPECT_EQ(calls, 0);
  EXPECT_EQ(thread.subscriptions(), 1U);
}

TEST(FakeCallbackThread, UnsubscribingWaitsForTheRunningCallback) {
  FakeCallbackThread thread;
  const FakeCallbackThread::Subscription subscription = thread.subscribe();
  Gate gate;
  gate.close();
  std::atomic<bool> hasEnded = false;
  thread.post(subscription, [&] {
    gate.pass();
    hasEnded = true;
  });
  gate.waitUntilStopped(1);
  std::jthread ender([&] {
    thread.unsubscribe(subscription);
    EXPECT_TRUE(hasEnded);
  });
  gate.open();
}

TEST(FakeCallbackThread, CallbackCanEndItsSubscription) {
  FakeCallbackThread thread;
  const FakeCallbackThread::Subscription subscription = thread.subscribe();
  std::atomic<int> calls = 0;
  for (int round = 0; round < 2; ++round) {
    thread.post(subscription, [&] {
      ++calls;
      thread.unsubscribe(subscription);
    });
  }
  thread.waitUntilIdle();
  EXPECT_EQ(calls, 1);
}

}  // namespace
}  // namespace appsync::test
