#include <atomic>
#include <limits>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "base/Semaphore.h"
#include "base/SystemClock.h"
#include "device/services/SystemNotify.h"
#include "kit/fakes/Gate.h"
#include "tests/support/ServiceDatabase.h"

namespace appsync::test {
namespace {

using device::SystemNotify;
using platform::SuspensionBehavior;

/// Counts what it hears, and passes its gate before it does.
struct Listener {
  Gate gate;
  std::vector<std::string> heard;
  std::vector<const void*> senders;
  std::vector<std::thread::id> threads;
  SystemClock clock;
  Semaphore called{clock, 0};
  std::function<void()> then = [] {};

  static void callback(void* context, std::string_view name, const void* object) {
    auto& self = *static_cast<Listener*>(context);
    self.gate.pass();
    self.heard.emplace_back(name);
    self.senders.push_back(object);
    self.threads.push_back(std::this_thread::get_id());
    self.then();
    self.called.signal();
  }
};

class SystemNotifyTest : public testing::Test {
 protected:
  void observe(Listener& listener, std::string_view name, const void* object = nullptr) {
    notify->addObserver(&listener, Listener::callback, name, object, SuspensionBehavior::drop);
  }
  /// Returns when all that was posted before has been heard.
  void drain() {
    observe(last, "drain");
    notify->post("drain");
    last.called.wait();
    notify->removeObserver(&last, "drain");
  }

  Listener first;
  Listener second;
  Listener last;
  ServiceDatabase<SystemNotify> database;
  std::unique_ptr<SystemNotify> notify = std::make_unique<SystemNotify>(database);
};

using Names = std::vector<std::string>;

TEST_F(SystemNotifyTest, APostReachesEveryObserverOfTheNameAndNobodyElse) {
  observe(first, "a");
  observe(second, "a");
  observe(second, "b");
  notify->post("a");
  notify->post("c");
  drain();
  EXPECT_EQ(first.heard, Names{"a"});
  EXPECT_EQ(second.heard, Names{"a"});
}

TEST_F(SystemNotifyTest, CallbacksComeOnAThreadOfTheServicesOwnInTheOrderOfThePosts) {
  observe(first, "a");
  observe(first, "b");
  for (const char* name : {"a", "b", "b", "a"})
    notify->post(name);
  drain();
  EXPECT_EQ(first.heard, (Names{"a", "b", "b", "a"}));
  EXPECT_EQ(first.threads, std::vector(4, first.threads.front()));
  EXPECT_NE(first.threads.front(), std::this_thread::get_id());
}

TEST_F(SystemNotifyTest, PostsHaveNoSender) {
  observe(first, "a");
  observe(second, "a", this);
  notify->post("a");
  drain();
  EXPECT_EQ(first.senders, std::vector<const void*>{nullptr});
  EXPECT_EQ(second.heard, Names{});
}

TEST_F(SystemNotifyTest, AddingAnObserverTwiceIsAddingItOnce) {
  observe(first, "a");
  observe(first, "a");
  notify->post("a");
  drain();
  EXPECT_EQ(first.heard, Names{"a"});
}

TEST_F(SystemNotifyTest, ARemovedObserverHearsNothing) {
  observe(first, "a");
  observe(first, "b");
  notify->removeObserver(&first, "a");
  notify->post("a");
  notify->post("b");
  drain();
  EXPECT_EQ(first.heard, Names{"b"});
}

TEST_F(SystemNotifyTest, RemovingAnObserverDropsPostsThatHaveNotReachedIt) {
  observe(first, "a");
  observe(second, "a");
  first.gate.close();
  notify->post("a");
  first.gate.waitUntilStopped(1);
  notify->removeObserver(&second, "a");
  first.gate.open();
  drain();
  EXPECT_EQ(second.heard, Names{});
}

TEST_F(SystemNotifyTest, RemovingAnObserverWaitsForItsRunningCallback) {
  observe(first, "a");
  first.gate.close();
  notify->post("a");
  first.gate.waitUntilStopped(1);
  std::thread opener([&] { first.gate.open(); });
  notify->removeObserver(&first, "a");
  EXPECT_EQ(first.heard, Names{"a"});
  opener.join();
}

TEST_F(SystemNotifyTest, AnObserverMayRemoveItselfAndPostWhileItIsCalled) {
  observe(first, "a");
  observe(second, "b");
  first.then = [&] {
    notify->removeObserver(&first, "a");
    notify->post("a");
    notify->post("b");
  };
  notify->post("a");
  second.called.wait();
  drain();
  EXPECT_EQ(first.heard, Names{"a"});
  EXPECT_EQ(second.heard, Names{"b"});
}

TEST_F(SystemNotifyTest, RemovingWhatWasNeverAddedDoesNothing) {
  notify->removeObserver(&first, "a");
  notify->post("a");
  drain();
  EXPECT_EQ(first.heard, Names{});
}

TEST_F(SystemNotifyTest, PostsFromManyThreadsAreAllHeard) {
  observe(first, "a");
  std::vector<std::thread> threads;
  for (int number = 0; number < 4; ++number) {
    threads.emplace_back([&] {
      for (int post = 0; post < 50; ++post)
        notify->post("a");
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  drain();
  EXPECT_EQ(first.heard.size(), 200U);
}

TEST_F(SystemNotifyTest, AStateIsSetThroughTheNamesToken) {
  const auto registration = notify->registerCheck("a");
  EXPECT_EQ(registration.status, 0U);
  EXPECT_EQ(notify->state("a"), std::nullopt);
  notify->setState(registration.token, 1);
  EXPECT_EQ(notify->state("a"), 1U);
  EXPECT_EQ(notify->state("b"), std::nullopt);
  notify->setState(registration.token, std::numeric_limits<std::uint64_t>::max());
  EXPECT_EQ(notify->state("a"), std::numeric_limits<std::uint64_t>::max());
}

TEST_F(SystemNotifyTest, RegistrationsOfOneNameShareATokenAndOthersDoNot) {
  const auto token = notify->registerCheck("a").token;
  EXPECT_EQ(notify->registerCheck("a").token, token);
  EXPECT_NE(notify->registerCheck("b").token, token);
}

TEST_F(SystemNotifyTest, AnEmptyNameCannotBeRegistered) {
  EXPECT_EQ(notify->registerCheck("").status, SystemNotify::kInvalidName);
}

TEST_F(SystemNotifyTest, AnUnknownTokenChangesNothing) {
  const auto token = notify->registerCheck("a").token;
  for (const int wrong : {token + 1, 0, -1})
    notify->setState(wrong, 5);
  EXPECT_EQ(notify->state("a"), std::nullopt);
}

TEST_F(SystemNotifyTest, AnObserverSeesTheStateThatWasSetBeforeThePost) {
  std::optional<std::uint64_t> seen;
  first.then = [&] { seen = notify->state("a"); };
  observe(first, "a");
  notify->setState(notify->registerCheck("a").token, 7);
  notify->post("a");
  first.called.wait();
  EXPECT_EQ(seen, 7U);
}

TEST_F(SystemNotifyTest, StatesOutliveTheProcessAndAreSeenBesideIt) {
  notify->setState(notify->registerCheck("a").token, 1);
  const auto reader = database.openReadOnly();
  EXPECT_EQ(SystemNotify(*reader).state("a"), 1U);
  notify.reset();
  database.reopen();
  notify = std::make_unique<SystemNotify>(database);
  EXPECT_EQ(notify->state("a"), 1U);
}

TEST_F(SystemNotifyTest, DestructionWaitsForARunningCallback) {
  observe(first, "a");
  first.gate.close();
  notify->post("a");
  first.gate.waitUntilStopped(1);
  std::thread opener([&] { first.gate.open(); });
  notify.reset();
  EXPECT_EQ(first.heard, Names{"a"});
  opener.join();
}

}  // namespace
}  // namespace appsync::test
