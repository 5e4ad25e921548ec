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

/// Records its callbacks, each after passing the gate.
struct Listener {
  Gate gate;
  std::vector<std::string> heard;
  std::vector<const void*> senders;
  std::vector<std::thread::id> threads;
  SystemClock clock;
  Semaphore called{clock, 0};

  static void callback(void* context, std::string_view name, const void* object) {
    auto& self = *static_cast<Listener*>(context);
    self.gate.pass();
    self.heard.emplace_back(name);
    self.senders.push_back(object);
    self.threads.push_back(std::this_thread::get_id());
    self.called.signal();
  }
};

class SystemNotifyTest : public testing::Test {
 protected:
  void observe(Listener& listener, std::string_view name, const void* object = nullptr) {
    notify->addObserver(&listener, Listener::callback, name, object, SuspensionBehavior::drop);
  }
  /// Blocks until every earlier post was delivered.
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

TEST_F(SystemNotifyTest, CallsObserversInOrderOnOneThread) {
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

TEST_F(SystemNotifyTest, AddObserverIsIdempotent) {
  observe(first, "a");
  observe(first, "a");
  notify->post("a");
  drain();
  EXPECT_EQ(first.heard, Names{"a"});
}

TEST_F(SystemNotifyTest, RemoveObserverDropsPendingPosts) {
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

TEST_F(SystemNotifyTest, SetsStateThroughToken) {
  const auto registration = notify->registerCheck("a");
  EXPECT_EQ(registration.status, 0U);
  EXPECT_EQ(notify->state("a"), std::nullopt);
  notify->setState(registration.token, 1);
  EXPECT_EQ(notify->state("a"), 1U);
  EXPECT_EQ(notify->state("b"), std::nullopt);
  notify->setState(registration.token, std::numeric_limits<std::uint64_t>::max());
  EXPECT_EQ(notify->state("a"), std::numeric_limits<std::uint64_t>::max());
}

TEST_F(SystemNotifyTest, EachNameHasOneToken) {
  const auto token = notify->registerCheck("a").token;
  EXPECT_EQ(notify->registerCheck("a").token, token);
  EXPECT_NE(notify->registerCheck("b").token, token);
}

TEST_F(SystemNotifyTest, RejectsEmptyName) {
  EXPECT_EQ(notify->registerCheck("").status, SystemNotify::kInvalidName);
}

TEST_F(SystemNotifyTest, IgnoresUnknownToken) {
  const auto token = notify->registerCheck("a").token;
  for (const int wrong : {token + 1, 0, -1})
    notify->setState(wrong, 5);
  EXPECT_EQ(notify->state("a"), std::nullopt);
}

TEST_F(SystemNotifyTest, StatesSurviveRestartAndAreReadable) {
  notify->setState(notify->registerCheck("a").token, 1);
  const auto reader = database.openReadOnly();
  EXPECT_EQ(SystemNotify(*reader).state("a"), 1U);
  notify.reset();
  database.reopen();
  notify = std::make_unique<SystemNotify>(database);
  EXPECT_EQ(notify->state("a"), 1U);
}

TEST_F(SystemNotifyTest, DestructionWaitsForRunningCallback) {
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
