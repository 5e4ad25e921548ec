#include <atomic>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "base/Semaphore.h"
#include "base/SystemClock.h"
#include "device/services/CallbackThread.h"
#include "kit/fakes/Gate.h"

namespace appsync::test {
namespace {

using device::CallbackThread;

class CallbackThreadTest : public testing::Test {
 protected:
  SystemClock clock;
  Semaphore done{clock, 0};
  const char first = 'a';
  const char second = 'b';
  CallbackThread thread;
};

TEST_F(CallbackThreadTest, RunsCallbacksInOrderOnOneOtherThread) {
  std::vector<int> order;
  std::vector<std::thread::id> threads;
  for (int number = 0; number < 100; ++number) {
    thread.post(number % 2 == 0 ? &first : &second, [&, number] {
      order.push_back(number);
      threads.push_back(std::this_thread::get_id());
      if (number == 99) done.signal();
    });
  }
  done.wait();
  for (int number = 0; number < 100; ++number)
    EXPECT_EQ(order[static_cast<std::size_t>(number)], number);
  EXPECT_EQ(std::vector(100, threads.front()), threads);
  EXPECT_NE(threads.front(), std::this_thread::get_id());
}

TEST_F(CallbackThreadTest, ForgetDropsOnlyCallbacksOfReceiver) {
  Gate gate;
  gate.close();
  std::string called;
  thread.post(&second, [&] { gate.pass(); });
  gate.waitUntilStopped(1);
  thread.post(&first, [&] { called += "first"; });
  thread.post(&second, [&] {
    called += "second";
    done.signal();
  });
  thread.forget(&first);
  gate.open();
  done.wait();
  EXPECT_EQ(called, "second");
}

TEST_F(CallbackThreadTest, ForgetWaitsForRunningCallback) {
  Gate gate;
  gate.close();
  std::atomic<bool> ended = false;
  thread.post(&first, [&] {
    gate.pass();
    ended = true;
  });
  gate.waitUntilStopped(1);
  std::thread opener([&] { gate.open(); });
  thread.forget(&first);
  EXPECT_TRUE(ended);
  opener.join();
}

TEST_F(CallbackThreadTest, ForgetDoesNotWaitForOtherReceivers) {
  Gate gate;
  gate.close();
  thread.post(&second, [&] { gate.pass(); });
  gate.waitUntilStopped(1);
  thread.forget(&first);
  EXPECT_EQ(gate.stopped(), 1U);
  gate.open();
  thread.forget(&second);  // The callback is done with the gate before it goes.
}

TEST_F(CallbackThreadTest, CallbackMayForgetItsReceiverAndPost) {
  thread.post(&first, [&] {
    thread.forget(&first);
    thread.post(&first, [&] { done.signal(); });
  });
  done.wait();
}

TEST_F(CallbackThreadTest, CapturesAreDestroyedAfterEachCallback) {
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watched = captured;
  thread.post(&first, [captured = std::move(captured)] {});
  thread.post(&second, [&] {
    EXPECT_TRUE(watched.expired());
    done.signal();
  });
  done.wait();
}

TEST_F(CallbackThreadTest, DestructionWaitsForRunningCallback) {
  Gate gate;
  gate.close();
  std::atomic<bool> ended = false;
  auto ending = std::make_unique<CallbackThread>();
  ending->post(&first, [&] {
    gate.pass();
    ended = true;
  });
  gate.waitUntilStopped(1);
  std::thread opener([&] { gate.open(); });
  ending.reset();
  EXPECT_TRUE(ended);
  opener.join();
}

TEST_F(CallbackThreadTest, DestructionDestroysQueuedCallbacks) {
  auto captured = std::make_shared<int>();
  const std::weak_ptr<int> watched = captured;
  {
    CallbackThread ending;
    ending.post(&first, [captured = std::move(captured)] {});
  }
  EXPECT_TRUE(watched.expired());
}

}  // namespace
}  // namespace appsync::test
