#include <mutex>
#include <thread>

#include <gtest/gtest-spi.h>
#include <gtest/gtest.h>

#include "kit/fakes/FakeAppRegistry.h"
#include "kit/fakes/FakePlatform.h"
#include "platform/Keys.h"

namespace appsync::test {
namespace {

using Lines = std::vector<std::string>;
using platform::AppRecords;
using platform::BundleKind;
using platform::TSInstallPhase;
using platform::TSInstallState;

const Error kFailure{"InstallerError", 7, "injected", nullptr};

class Observer final : public platform::AppRegistryObserver {
 public:
  void applicationInstallsArePrioritized(const AppRecords& prioritized, const AppRecords& paused) override {
    const std::scoped_lock lock(mutex_);
    reports_.push_back(description(prioritized) + " " + description(paused));
  }
  void applicationInstallsDidCancel(const AppRecords& records) override {
    const std::scoped_lock lock(mutex_);
    reports_.push_back("cancelled " + description(records));
  }
  [[nodiscard]] Lines reports() {
    const std::scoped_lock lock(mutex_);
    return reports_;
  }

 private:
  std::mutex mutex_;
  Lines reports_;
};

class FakeAppRegistryTest : public testing::Test {
 protected:
  Status install(const std::string& identifier) {
    platform.files.put("/packages/" + identifier, "package");
    return platform.registry.installApplication(
        {"/packages/" + identifier, false},
        {{platform::PackageTypeKey, platform::kPackageTypeCustomer}, {platform::BundleIdentifierKey, identifier}});
  }

  FakePlatform platform;
};

TEST_F(FakeAppRegistryTest, GateHoldsInstalls) {
  platform.registry.installGate.close();
  std::vector<std::jthread> threads;
  for (int index = 0; index < 3; ++index) {
    threads.emplace_back([this, index] { EXPECT_TRUE(install("com.a" + std::to_string(index)).ok()); });
  }
  platform.registry.installGate.waitUntilStopped(3);
  EXPECT_EQ(platform.registry.installs().size(), 3U);
  EXPECT_EQ(platform.registry.mostInstallsAtOnce(), 3U);
  EXPECT_EQ(platform.registry.identifiers(), Lines());
  platform.registry.installGate.open();
  threads.clear();
  EXPECT_EQ(platform.registry.identifiers(), (Lines{"com.a0", "com.a1", "com.a2"}));
}

TEST_F(FakeAppRegistryTest, CountsNoConcurrencyOfSequentialInstalls) {
  EXPECT_TRUE(install("com.a").ok());
  EXPECT_TRUE(install("com.b").ok());
  EXPECT_EQ(platform.registry.mostInstallsAtOnce(), 1U);
}

TEST_F(FakeAppRegistryTest, RecordsOptionsAndLocationOfInstalls) {
  EXPECT_TRUE(install("com.a").ok());
  const auto installs = platform.registry.installs();
  ASSERT_EQ(installs.size(), 1U);
  EXPECT_EQ(installs[0].identifier, "com.a");
  EXPECT_EQ(installs[0].location.path, "/packages/com.a");
  EXPECT_EQ(installs[0].options.size(), 2U);
}

TEST_F(FakeAppRegistryTest, InjectedFailureChangesNothing) {
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", kFailure);
  EXPECT_EQ(install("com.a").failure(), kFailure);
  EXPECT_EQ(platform.registry.identifiers(), Lines());
  EXPECT_EQ(platform.registry.installs().size(), 1U);
  EXPECT_TRUE(install("com.a").ok());
}

TEST_F(FakeAppRegistryTest, InjectedFailureLeavesTheApp) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.registry.failures.failAlways(RegistryOperation::uninstallApplication, "com.a", kFailure);
  EXPECT_EQ(platform.registry.uninstallApplication("com.a").failure(), kFailure);
  EXPECT_TRUE(platform.registry.app("com.a"));
  EXPECT_EQ(platform.registry.uninstalls(), (std::vector<FakeAppRegistry::Uninstall>{{"com.a", {}}}));
}

TEST_F(FakeAppRegistryTest, ObserversReceiveTheInstallOrder) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.registry.add(FakeApp::installed("com.b"));
  platform.registry.add(FakeApp::placeholder("com.c"));
  platform.registry.setInstallOrder({"com.c", "com.a", "com.unknown"}, {"com.b"});
  Observer observer;
  platform.registry.addObserver(observer);
  platform.registry.setInstallOrder({});
  platform.registry.waitUntilReported();
  EXPECT_EQ(observer.reports(), (Lines{"(com.c, com.a) (com.b)", "() ()"}));
  platform.registry.removeObserver(observer);
}

TEST_F(FakeAppRegistryTest, GateHoldsReports) {
  Observer observer;
  platform.registry.reportGate.close();
  platform.registry.addObserver(observer);
  platform.registry.reportGate.waitUntilStopped(1);
  EXPECT_EQ(observer.reports(), Lines());
  platform.registry.reportGate.open();
  platform.registry.removeObserver(observer);
}

TEST_F(FakeAppRegistryTest, JournalsSettersOfProgress) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  const auto progress = platform.registry.app("com.a")->progress;
  progress->setInstallState(TSInstallState::Active);
  progress->setInstallPhase(TSInstallPhase::RestoringData);
  progress->setTotalUnitCount(1000);
  progress->setCompletedUnitCount(456);
  progress->cancel();
  EXPECT_EQ(progress->calls(), (Lines{"setInstallState 1", "setInstallPhase 2", "setTotalUnitCount 1000",
                                      "setCompletedUnitCount 456", "cancel"}));
  EXPECT_EQ(platform.journal.lines({"progress."}),
            (Lines{"progress.setInstallState 1 com.a", "progress.setInstallPhase 2 com.a",
                   "progress.setTotalUnitCount 1000 com.a", "progress.setCompletedUnitCount 456 com.a",
                   "progress.cancel com.a"}));
}

TEST_F(FakeAppRegistryTest, ReportsCancellationAfterTheStateChanged) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  Observer observer;
  platform.registry.addObserver(observer);
  const auto progress = platform.registry.app("com.a")->progress;
  progress->cancel();
  platform.registry.waitUntilReported();
  EXPECT_EQ(progress->installState(), TSInstallState::Canceled);
  EXPECT_EQ(observer.reports(), (Lines{"() ()", "cancelled (com.a)"}));
  platform.registry.removeObserver(observer);
}

TEST_F(FakeAppRegistryTest, EnumeratesBundlesThatAreNotAppsByKind) {
  platform.registry.add(FakeApp::installed("com.app"));
  platform.registry.addBundle("com.app", BundleKind::user);
  platform.registry.addBundle("com.extension", BundleKind::system);
  const auto walk = [&](BundleKind kind) {
    Lines met;
    platform.registry.enumerateBundlesOfType(kind, [&](const platform::BundleRecord& bundle, bool&) {
      met.push_back((bundle.asAppRecord() != nullptr ? "app " : "other ") + bundle.applicationIdentifier());
    });
    return met;
  };
  EXPECT_EQ(walk(BundleKind::all), (Lines{"app com.app", "other com.app", "other com.extension"}));
  EXPECT_EQ(walk(BundleKind::user), (Lines{"app com.app", "other com.app"}));
  EXPECT_EQ(walk(BundleKind::system), Lines{"other com.extension"});
}

TEST_F(FakeAppRegistryTest, JournalHookFailsEveryOperation) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  const auto record = platform.registry.recordForIdentifier("com.a", platform::PlaceholderLookup::on);
  const auto progress = platform.registry.app("com.a")->progress;
  platform.journal.setHook([](std::string_view, std::string_view) -> std::optional<Error> { return kFailure; });
  EXPECT_FALSE(platform.registry.applicationIsInstalled("com.a"));
  EXPECT_EQ(platform.registry.recordForIdentifier("com.a", platform::PlaceholderLookup::on), nullptr);
  platform.registry.enumerateBundlesOfType(BundleKind::all, [](const platform::BundleRecord&, bool&) { FAIL(); });
  EXPECT_EQ(install("com.a").failure(), kFailure);
  EXPECT_EQ(platform.registry.uninstallApplication("com.a").failure(), kFailure);
  EXPECT_EQ(platform.registry.installProgressForApplication(*record, TSInstallPhase::Loading), nullptr);
  progress->setInstallState(TSInstallState::Failed);
  EXPECT_EQ(progress->installState(), TSInstallState::Waiting);
  EXPECT_EQ(platform.registry.identifiers(), Lines{"com.a"});
}

TEST(FakeAppRegistry, RegisteredObserverFailsTheTest) {
  Observer observer;
  EXPECT_NONFATAL_FAILURE(
      {
        FakePlatform platform;
        platform.registry.addObserver(observer);
      },
      "the registry is destroyed while an observer is registered");
}

TEST(FakeAppRegistry, ProgressCanOutliveTheRegistry) {
  std::shared_ptr<FakeInstallProgress> progress;
  {
    FakePlatform platform;
    platform.registry.add(FakeApp::placeholder("com.a"));
    progress = platform.registry.app("com.a")->progress;
  }
  progress->cancel();
  EXPECT_EQ(progress->calls(), Lines{"cancel"});
}

}  // namespace
}  // namespace appsync::test
