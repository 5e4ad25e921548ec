#include "kit/contracts/SystemNotifyContract.h"

#include <atomic>
#include <functional>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "kit/contracts/EventCounter.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::SuspensionBehavior;
using platform::SystemNotify;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(SystemNotifyContract);

namespace {

constexpr std::string_view kName = "com.corvel.contract.first";
constexpr std::string_view kOtherName = "com.corvel.contract.second";

/// Registered as an observer during its lifetime.
class Listener {
 public:
  explicit Listener(SystemNotify& notify, std::string_view name = kName, const void* object = nullptr)
      : notify_(notify), name_(name) {
    notify_.addObserver(this, &Listener::called, name_, object, SuspensionBehavior::drop);
  }
  ~Listener() { stop(); }
  Listener(const Listener&) = delete;
  Listener& operator=(const Listener&) = delete;

  void stop() { notify_.removeObserver(this, name_); }

  [[nodiscard]] std::string lastName() {
    const std::scoped_lock lock(mutex_);
    return lastName_;
  }

  EventCounter calls;
  /// Runs in each callback. Must be set before the first post.
  std::function<void()> inCall;
  std::thread::id thread;

 private:
  static void called(void* context, std::string_view name, const void*) {
    Listener& self = *static_cast<Listener*>(context);
    EXPECT_EQ(++self.inside_, 1) << "callbacks to one observer must not overlap";
    {
      const std::scoped_lock lock(self.mutex_);
      self.lastName_ = name;
      self.thread = std::this_thread::get_id();
    }
    if (self.inCall) self.inCall();
    --self.inside_;
    self.calls.add();
  }

  SystemNotify& notify_;
  const std::string name_;
  std::atomic<int> inside_ = 0;
  std::mutex mutex_;
  std::string lastName_;
};

}  // namespace

TEST_P(SystemNotifyContract, PostReachesItsObserver) {
  Listener listener(subject().notify());
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(1));
  EXPECT_EQ(listener.lastName(), kName);
}

TEST_P(SystemNotifyContract, CallsObserversOnAnotherThread) {
  Listener listener(subject().notify());
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(1));
  EXPECT_NE(listener.thread, std::this_thread::get_id());
}

TEST_P(SystemNotifyContract, CallsEveryObserverOfTheName) {
  Listener first(subject().notify());
  Listener second(subject().notify());
  subject().notify().post(kName);
  EXPECT_TRUE(first.calls.waitFor(1));
  EXPECT_TRUE(second.calls.waitFor(1));
}

TEST_P(SystemNotifyContract, DoesNotCallObserversOfOtherNames) {
  Listener other(subject().notify(), kOtherName);
  Listener listener(subject().notify());
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(1));
  subject().notify().post(kOtherName);
  ASSERT_TRUE(other.calls.waitFor(1));
  EXPECT_EQ(other.calls.count(), 1U);
  EXPECT_EQ(listener.calls.count(), 1U);
}

TEST_P(SystemNotifyContract, FiltersPostsBySender) {
  const int sender = 0;
  Listener choosy(subject().notify(), kName, &sender);
  Listener listener(subject().notify());
  subject().notify().post(kName);
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(2));
  EXPECT_EQ(choosy.calls.count(), 0U);
}

TEST_P(SystemNotifyContract, PostWithoutObserversIsLost) {
  subject().notify().post(kName);
  Listener listener(subject().notify());
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(1));
  EXPECT_EQ(listener.calls.count(), 1U);
}

TEST_P(SystemNotifyContract, DoesNotCallRemovedObservers) {
  Listener removed(subject().notify());
  Listener listener(subject().notify());
  removed.stop();
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(1));
  EXPECT_EQ(removed.calls.count(), 0U);
}

TEST_P(SystemNotifyContract, RemovalAffectsOneNameOnly) {
  Listener listener(subject().notify());
  subject().notify().removeObserver(&listener, kOtherName);
  subject().notify().post(kName);
  EXPECT_TRUE(listener.calls.waitFor(1));
}

TEST_P(SystemNotifyContract, RemovingAnUnknownObserverDoesNothing) {
  int nobody = 0;
  subject().notify().removeObserver(&nobody, kName);
}

TEST_P(SystemNotifyContract, RemovalWaitsForTheRunningCallback) {
  EventCounter begun;
  EventCounter mayEnd;
  std::atomic<bool> hasEnded = false;
  Listener listener(subject().notify());
  listener.inCall = [&] {
    begun.add();
    static_cast<void>(mayEnd.waitFor(1));
    hasEnded = true;
  };
  subject().notify().post(kName);
  ASSERT_TRUE(begun.waitFor(1));
  std::jthread remover([&] {
    listener.stop();
    EXPECT_TRUE(hasEnded);
  });
  mayEnd.add();
}

TEST_P(SystemNotifyContract, ObserverCanBeRemovedInItsCallback) {
  Listener listener(subject().notify());
  listener.inCall = [&] { listener.stop(); };
  Listener other(subject().notify());
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(1));
  ASSERT_TRUE(other.calls.waitFor(1));
  subject().notify().post(kName);
  ASSERT_TRUE(other.calls.waitFor(2));
  EXPECT_EQ(listener.calls.count(), 1U);
}

TEST_P(SystemNotifyContract, CallbackCanCallTheService) {
  Listener other(subject().notify(), kOtherName);
  Listener listener(subject().notify());
  listener.inCall = [&] {
    const SystemNotify::Registration registration = subject().notify().registerCheck(kOtherName);
    EXPECT_EQ(registration.status, 0U);
    subject().notify().setState(registration.token, 1);
    subject().notify().post(kOtherName);
  };
  subject().notify().post(kName);
  EXPECT_TRUE(other.calls.waitFor(1));
}

TEST_P(SystemNotifyContract, StateIsSetBeforeThePostIsDelivered) {
  const SystemNotify::Registration registration = subject().notify().registerCheck(kName);
  ASSERT_EQ(registration.status, 0U);
  std::optional<std::uint64_t> seen;
  Listener listener(subject().notify());
  listener.inCall = [&] { seen = subject().stateOf(kName); };
  subject().notify().setState(registration.token, 0x1'0000'0001);
  subject().notify().post(kName);
  ASSERT_TRUE(listener.calls.waitFor(1));
  if (!seen) GTEST_SKIP() << "the subject cannot read states";
  EXPECT_EQ(*seen, 0x1'0000'0001U);
}

TEST_P(SystemNotifyContract, StatesOfNamesAreIndependent) {
  const SystemNotify::Registration first = subject().notify().registerCheck(kName);
  const SystemNotify::Registration second = subject().notify().registerCheck(kOtherName);
  ASSERT_EQ(first.status, 0U);
  ASSERT_EQ(second.status, 0U);
  subject().notify().setState(first.token, 1);
  subject().notify().setState(second.token, 2);
  if (!subject().stateOf(kName)) GTEST_SKIP() << "the subject cannot read states";
  EXPECT_EQ(subject().stateOf(kName), 1U);
  EXPECT_EQ(subject().stateOf(kOtherName), 2U);
}

TEST_P(SystemNotifyContract, NameCanBeRegisteredRepeatedly) {
  for (std::uint64_t state = 1; state <= 3; ++state) {
    const SystemNotify::Registration registration = subject().notify().registerCheck(kName);
    ASSERT_EQ(registration.status, 0U);
    subject().notify().setState(registration.token, state);
    if (subject().stateOf(kName)) {
      EXPECT_EQ(subject().stateOf(kName), state);
    }
  }
}

TEST_P(SystemNotifyContract, CallbacksToOneObserverNeverOverlap) {
  Listener listener(subject().notify());
  listener.inCall = [] { std::this_thread::yield(); };
  runOnThreads(4, [&](std::size_t) {
    for (int round = 0; round < 5; ++round)
      subject().notify().post(kName);
  });
  EXPECT_TRUE(listener.calls.waitFor(20));
}

TEST_P(SystemNotifyContract, IsThreadSafe) {
  Listener listener(subject().notify());
  runOnThreads(8, [&](std::size_t) {
    Listener own(subject().notify());
    const SystemNotify::Registration registration = subject().notify().registerCheck(kName);
    subject().notify().setState(registration.token, 1);
    subject().notify().post(kName);
    EXPECT_TRUE(own.calls.waitFor(1));
  });
  EXPECT_TRUE(listener.calls.waitFor(8));
}

}  // namespace appsync::test
