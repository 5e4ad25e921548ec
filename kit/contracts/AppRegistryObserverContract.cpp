// AppRegistryContract: observers, and progress of running installs.
#include <atomic>
#include <functional>
#include <mutex>
#include <thread>

#include "kit/contracts/AppRegistryContract.h"
#include "kit/contracts/EventCounter.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::AppRecords;
using platform::InstallProgress;
using platform::TSInstallPhase;
using platform::TSInstallState;

namespace {

/// Registered as an observer during its lifetime.
class Observer final : public platform::AppRegistryObserver {
 public:
  explicit Observer(platform::AppRegistry& registry, std::function<void()> inReport = nullptr)
      : registry_(registry), inReport_(std::move(inReport)) {
    registry_.addObserver(*this);
  }
  ~Observer() override { stop(); }
  Observer(const Observer&) = delete;
  Observer& operator=(const Observer&) = delete;

  void stop() { registry_.removeObserver(*this); }

  void applicationInstallsArePrioritized(const AppRecords&, const AppRecords&) override {
    EXPECT_EQ(++inside_, 1) << "callbacks to one observer must not overlap";
    thread = std::this_thread::get_id();
    if (inReport_) inReport_();
    --inside_;
    reports.add();
  }

  void applicationInstallsDidCancel(const AppRecords& records) override {
    EXPECT_EQ(++inside_, 1) << "callbacks to one observer must not overlap";
    {
      const std::scoped_lock lock(mutex_);
      for (const auto& record : records)
        cancelled_.push_back(record->applicationIdentifier());
    }
    --inside_;
    cancellations.add();
  }

  [[nodiscard]] std::vector<std::string> cancelled() {
    const std::scoped_lock lock(mutex_);
    return cancelled_;
  }

  EventCounter reports;
  EventCounter cancellations;
  std::atomic<std::thread::id> thread;

 private:
  platform::AppRegistry& registry_;
  std::function<void()> inReport_;
  std::atomic<int> inside_ = 0;
  std::mutex mutex_;
  std::vector<std::string> cancelled_;
};

}  // namespace

// Observers.

TEST_P(AppRegistryContract, NotifiesANewObserver) {
  Observer observer(registry());
  ASSERT_TRUE(observer.reports.waitFor(1));
  EXPECT_NE(observer.thread.load(), std::this_thread::get_id());
}

TEST_P(AppRegistryContract, NotifiesObserversOfChanges) {
  Observer observer(registry());
  ASSERT_TRUE(observer.reports.waitFor(1));
  const std::size_t before = observer.reports.count();
  subject().changeInstallOrder();
  EXPECT_TRUE(observer.reports.waitFor(before + 1));
}

TEST_P(AppRegistryContract, AddingAnObserverIsIdempotent) {
  Observer observer(registry());
  registry().addObserver(observer);
  ASSERT_TRUE(observer.reports.waitFor(1));
  observer.stop();
  const std::size_t before = observer.reports.count();
  Observer witness(registry());
  ASSERT_TRUE(witness.reports.waitFor(1));
  subject().changeInstallOrder();
  ASSERT_TRUE(witness.reports.waitFor(2));
  EXPECT_EQ(observer.reports.count(), before);
}

TEST_P(AppRegistryContract, RemovingAnUnknownObserverDoesNothing) {
  platform::AppRegistryObserver stranger;
  registry().removeObserver(stranger);
}

TEST_P(AppRegistryContract, ObserverCanBeAddedAgain) {
  Observer observer(registry());
  observer.stop();
  const std::size_t before = observer.reports.count();
  registry().addObserver(observer);
  EXPECT_TRUE(observer.reports.waitFor(before + 1));
}

TEST_P(AppRegistryContract, RemovingAnObserverWaitsForItsCallback) {
  EventCounter begun;
  EventCounter mayEnd;
  std::atomic<bool> hasEnded = false;
  Observer observer(registry(), [&] {
    begun.add();
    static_cast<void>(mayEnd.waitFor(1));
    hasEnded = true;
  });
  ASSERT_TRUE(begun.waitFor(1));
  std::jthread remover([&] {
    observer.stop();
    EXPECT_TRUE(hasEnded);
  });
  mayEnd.add();
}

TEST_P(AppRegistryContract, ObserverCanBeRemovedInItsCallback) {
  platform::AppRegistry& observed = registry();
  Observer* self = nullptr;
  EventCounter mayBegin;
  Observer observer(observed, [&] {
    static_cast<void>(mayBegin.waitFor(1));
    self->stop();
  });
  self = &observer;
  mayBegin.add();
  ASSERT_TRUE(observer.reports.waitFor(1));
  Observer witness(observed);
  ASSERT_TRUE(witness.reports.waitFor(1));
  subject().changeInstallOrder();
  ASSERT_TRUE(witness.reports.waitFor(2));
  EXPECT_EQ(observer.reports.count(), 1U);
}

TEST_P(AppRegistryContract, CallbackCanCallTheRegistry) {
  install("com.a");
  Observer observer(registry(), [&] {
    EXPECT_TRUE(registry().applicationIsInstalled("com.a"));
    EXPECT_NE(record("com.a"), nullptr);
    platform::AppRegistryObserver other;
    registry().addObserver(other);
    registry().removeObserver(other);
  });
  EXPECT_TRUE(observer.reports.waitFor(1));
}

TEST_P(AppRegistryContract, ObserversCanBeAddedAndRemovedConcurrently) {
  runOnThreads(6, [&](std::size_t) {
    for (int round = 0; round < 10; ++round) {
      Observer observer(registry());
      EXPECT_TRUE(observer.reports.waitFor(1));
    }
  });
}

// Progress.

TEST_P(AppRegistryContract, AppWithoutInstallHasNoProgress) {
  install("com.a");
  EXPECT_EQ(progressOf("com.a"), nullptr);
  EXPECT_EQ(record("com.a")->installProgress(), nullptr);
}

TEST_P(AppRegistryContract, PlaceholderHasProgress) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  EXPECT_GT(progress->totalUnitCount(), 0);
  EXPECT_FALSE(progress->description().empty());
}

TEST_P(AppRegistryContract, ProgressStoresItsValues) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  progress->setInstallState(TSInstallState::Active);
  progress->setInstallPhase(TSInstallPhase::RestoringData);
  progress->setTotalUnitCount(1000);
  progress->setCompletedUnitCount(456);
  EXPECT_EQ(progress->installState(), TSInstallState::Active);
  EXPECT_EQ(progress->installPhase(), TSInstallPhase::RestoringData);
  EXPECT_EQ(progress->totalUnitCount(), 1000);
  EXPECT_EQ(progress->completedUnitCount(), 456);
}

TEST_P(AppRegistryContract, ProgressIsShared) {
  placeholder("com.a");
  const auto before = record("com.a")->installProgress();
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  progress->setInstallState(TSInstallState::Active);
  progress->setTotalUnitCount(1000);
  progress->setCompletedUnitCount(456);
  ASSERT_NE(before, nullptr);
  EXPECT_EQ(before->completedUnitCount(), 456);
  const auto after = record("com.a")->installProgress();
  ASSERT_NE(after, nullptr);
  EXPECT_EQ(after->installState(), TSInstallState::Active);
  EXPECT_EQ(after->totalUnitCount(), 1000);
}

TEST_P(AppRegistryContract, InstallEndsItsProgress) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  install("com.a");
  EXPECT_EQ(progressOf("com.a"), nullptr);
}

TEST_P(AppRegistryContract, ProgressIsConstantAfterTheInstall) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  install("com.a");
  const std::int64_t units = progress->completedUnitCount();
  progress->setCompletedUnitCount(units + 7);
  progress->cancel();
  EXPECT_EQ(progress->completedUnitCount(), units);
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(AppRegistryContract, ProgressCanOutliveItsApp) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  progress->setCompletedUnitCount(5);
  progress->setInstallState(TSInstallState::Failed);
  progress->cancel();
  registry().installPhaseFinishedForProgress(*progress);
  EXPECT_FALSE(progress->description().empty());
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(AppRegistryContract, NotifiesObserversOfCancellation) {
  placeholder("com.a");
  Observer observer(registry());
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  progress->cancel();
  EXPECT_EQ(progress->installState(), TSInstallState::Canceled);
  ASSERT_TRUE(observer.cancellations.waitFor(1));
  EXPECT_EQ(observer.cancelled(), std::vector<std::string>{"com.a"});
}

TEST_P(AppRegistryContract, EndingAFailedLoadEndsItsProgress) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  progress->setInstallState(TSInstallState::Failed);
  registry().installPhaseFinishedForProgress(*progress);
  const auto shown = record("com.a")->installProgress();
  EXPECT_TRUE(shown == nullptr || shown->installState() >= TSInstallState::Canceled);
}

TEST_P(AppRegistryContract, EndingALoadBeginsTheInstallingPhase) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  progress->setInstallState(TSInstallState::Active);
  registry().installPhaseFinishedForProgress(*progress);
  EXPECT_NE(progress->installPhase(), TSInstallPhase::Loading);
  install("com.a");
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(AppRegistryContract, ProgressIsThreadSafe) {
  placeholder("com.a");
  const auto progress = progressOf("com.a");
  ASSERT_NE(progress, nullptr);
  progress->setTotalUnitCount(1000);
  runOnThreads(8, [&](std::size_t index) {
    for (int round = 0; round < 50; ++round) {
      progress->setInstallState(TSInstallState::Active);
      progress->setCompletedUnitCount(static_cast<std::int64_t>(index));
      EXPECT_EQ(progress->installState(), TSInstallState::Active);
    }
  });
  EXPECT_LT(progress->completedUnitCount(), 8);
}

}  // namespace appsync::test
