// Reports to observers that the registry contract leaves open.
#include <atomic>
#include <condition_variable>
#include <mutex>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "kit/contracts/EventCounter.h"
#include "kit/fakes/Patience.h"
#include "tests/device/apps/AppRegistryFixture.h"

namespace appsync::test {

using platform::AppRecords;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

namespace {

Identifiers identifiersOf(const AppRecords& records) {
  Identifiers identifiers;
  for (const auto& record : records)
    identifiers.push_back(record->applicationIdentifier());
  return identifiers;
}

/// Records the latest report.
class Listener final : public platform::AppRegistryObserver {
 public:
  void applicationInstallsArePrioritized(const AppRecords& prioritized, const AppRecords& paused) override {
    const std::scoped_lock lock(mutex_);
    prioritized_ = identifiersOf(prioritized);
    paused_ = identifiersOf(paused);
    changed_.notify_all();
  }
  void applicationInstallsDidCancel(const AppRecords& records) override {
    const std::scoped_lock lock(mutex_);
    cancelled_ = records;
    changed_.notify_all();
  }
  /// Blocks until a report with this content arrives.
  [[nodiscard]] bool hears(const Identifiers& prioritized, const Identifiers& paused) {
    std::unique_lock lock(mutex_);
    return changed_.wait_for(lock, kPatience, [&] { return prioritized_ == prioritized && paused_ == paused; });
  }
  [[nodiscard]] AppRecords hearsOfCancellation() {
    std::unique_lock lock(mutex_);
    changed_.wait_for(lock, kPatience, [&] { return !cancelled_.empty(); });
    return cancelled_;
  }

 private:
  std::mutex mutex_;
  std::condition_variable changed_;
  Identifiers prioritized_{"nothing heard yet"};
  Identifiers paused_;
  AppRecords cancelled_;
};

/// Observes during its lifetime.
class Observation {
 public:
  Observation(device::AppRegistry& registry, platform::AppRegistryObserver& observer)
      : registry_(registry), observer_(observer) {
    registry_.addObserver(observer_);
  }
  ~Observation() { registry_.removeObserver(observer_); }
  Observation(const Observation&) = delete;
  Observation& operator=(const Observation&) = delete;

 private:
  device::AppRegistry& registry_;
  platform::AppRegistryObserver& observer_;
};

std::ptrdiff_t threadsOfThisProcess() {
  return TestDevice::entriesIn("/proc/self/task");
}

}  // namespace

TEST_F(AppRegistryTest, ReportsInstallsInOrderOfStart) {
  for (const char* identifier : {"com.c", "com.a", "com.b"})
    device_.placeholder(identifier);
  Listener listener;
  const Observation observation(registry(), listener);
  EXPECT_TRUE(listener.hears({"com.c", "com.a", "com.b"}, {}));
  registry().prioritizeInstall("com.b");
  EXPECT_TRUE(listener.hears({"com.b", "com.c", "com.a"}, {}));
  registry().prioritizeInstall("com.unknown");
  progress("com.c")->setInstallState(TSInstallState::Paused);
  EXPECT_TRUE(listener.hears({"com.b", "com.a"}, {"com.c"}));
  progress("com.b")->setInstallState(TSInstallState::Failed);
  EXPECT_TRUE(listener.hears({"com.a"}, {"com.c"}));
  device_.install("com.a");
  EXPECT_TRUE(listener.hears({}, {"com.c"}));
}

TEST_F(AppRegistryTest, ReportsRecordsWithProgress) {
  class Checker final : public platform::AppRegistryObserver {
   public:
    void applicationInstallsArePrioritized(const AppRecords& prioritized, const AppRecords&) override {
      ASSERT_EQ(prioritized.size(), 1U);
      EXPECT_TRUE(prioritized.front()->isPlaceholder());
      EXPECT_EQ(prioritized.front()->installType(), TSInstallType::Sync);
      ASSERT_NE(prioritized.front()->installProgress(), nullptr);
      EXPECT_EQ(prioritized.front()->installProgress()->installState(), TSInstallState::Waiting);
      reports.add();
    }
    EventCounter reports;
  };
  device_.placeholder("com.a");
  Checker checker;
  const Observation observation(registry(), checker);
  EXPECT_TRUE(checker.reports.waitFor(1));
}

TEST_F(AppRegistryTest, ReportsCancelledInstall) {
  device_.placeholder("com.a");
  Listener listener;
  const Observation observation(registry(), listener);
  progress("com.a")->cancel();
  EXPECT_EQ(identifiersOf(listener.hearsOfCancellation()), Identifiers{"com.a"});
  EXPECT_TRUE(listener.hears({}, {}));
}

TEST_F(AppRegistryTest, HasThreadOnlyWithObservers) {
  const std::ptrdiff_t before = threadsOfThisProcess();
  Listener listener;
  {
    const Observation observation(registry(), listener);
    ASSERT_TRUE(listener.hears({}, {}));
    EXPECT_EQ(threadsOfThisProcess(), before + 1);
  }
  EXPECT_EQ(threadsOfThisProcess(), before);
}

TEST_F(AppRegistryTest, CallbackMayRemoveOtherObserver) {
  class Remover final : public platform::AppRegistryObserver {
   public:
    Remover(device::AppRegistry& observed, platform::AppRegistryObserver& other) : registry_(observed), other_(other) {}
    void applicationInstallsArePrioritized(const AppRecords&, const AppRecords&) override {
      registry_.removeObserver(other_);
      registry_.removeObserver(*this);
      done.add();
    }
    EventCounter done;

   private:
    device::AppRegistry& registry_;
    platform::AppRegistryObserver& other_;
  };
  platform::AppRegistryObserver other;
  Remover remover(registry(), other);
  registry().addObserver(other);
  registry().addObserver(remover);
  ASSERT_TRUE(remover.done.waitFor(1));
  Listener listener;
  const Observation observation(registry(), listener);
  EXPECT_TRUE(listener.hears({}, {}));
}

}  // namespace appsync::test
