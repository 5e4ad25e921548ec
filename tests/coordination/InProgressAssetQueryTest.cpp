// Which installs are running at this moment.
#include <chrono>
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <stop_token>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "coordination/InProgressAssetQuery.h"
#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/TextDiff.h"

namespace appsync::test {

namespace {

using platform::AppRecords;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;
using IdentifierList = InProgressAssetQuery::IdentifierList;

/// A clock on which nothing ever comes in time.
class ImpatientClock final : public Clock {
 public:
  TimePoint now() const override { return {}; }
  bool wait(std::condition_variable&, std::unique_lock<std::mutex>&, TimePoint deadline,
            const std::function<bool()>&) override {
    lastDeadline = deadline;
    return false;
  }
  TimePoint lastDeadline{};
};

std::shared_ptr<const platform::AppRecord> record(const FakeApp& app) {
  return std::make_shared<FakeAppRecord>(app);
}

FakeApp active(std::string identifier, TSInstallType type, TSInstallPhase phase) {
  return FakeApp::placeholder(std::move(identifier), type).withProgress(TSInstallState::Active, phase);
}

class InProgressQuery : public testing::Test {
 protected:
  void ask() { InProgressAssetQuery::currentInProgressAssetIDs(platform, inProgress, restoring); }

  FakePlatform platform;
  std::optional<IdentifierList> inProgress;
  std::optional<IdentifierList> restoring;
};

}  // namespace

TEST_F(InProgressQuery, WithoutInstallsBothListsAreEmptyAndPresent) {
  ask();
  EXPECT_EQ(inProgress, IdentifierList{});
  EXPECT_EQ(restoring, IdentifierList{});
}

TEST_F(InProgressQuery, TheQueryObservesTheRegistryForAsLongAsItAsks) {
  ask();
  EXPECT_TRUE(sameLines({"registry.addObserver", "registry.removeObserver"}, platform.journal.lines()));
  EXPECT_EQ(platform.registry.observerCount(), 0U);
}

TEST_F(InProgressQuery, AnAnswerOfEarlierIsForgotten) {
  inProgress = IdentifierList{"com.old"};
  restoring = IdentifierList{"com.old"};
  ask();
  EXPECT_EQ(inProgress, IdentifierList{});
  EXPECT_EQ(restoring, IdentifierList{});
}

TEST_F(InProgressQuery, InstallsOfOtherClientsAreSortedIntoTheirLists) {
  platform.registry.add(active("com.store", TSInstallType::StoreDownload, TSInstallPhase::Loading));
  platform.registry.add(active("com.restore", TSInstallType::Restore, TSInstallPhase::Installing));
  platform.registry.add(active("com.sync", TSInstallType::Sync, TSInstallPhase::Installing));
  platform.registry.add(active("com.waits", TSInstallType::Sync, TSInstallPhase::Loading));
  platform.registry.setInstallOrder({"com.sync", "com.restore", "com.waits", "com.store"});
  ask();
  EXPECT_EQ(inProgress, (IdentifierList{"com.sync", "com.store"})) << "in the registry's order";
  EXPECT_EQ(restoring, IdentifierList{"com.restore"});
}

TEST_F(InProgressQuery, AReportThatComesLateIsWaitedFor) {
  platform.registry.reportGate.close();
  platform.registry.add(active("com.a", TSInstallType::Sync, TSInstallPhase::Installing));
  platform.registry.setInstallOrder({"com.a"});
  std::jthread asking([&] { ask(); });
  platform.registry.reportGate.waitUntilStopped(1);
  platform.time.advance(std::chrono::hours(24 * 365));
  platform.registry.reportGate.open();
  asking.join();
  EXPECT_EQ(inProgress, IdentifierList{"com.a"});
}

TEST_F(InProgressQuery, ARegistryThatNeverReportsLeavesBothListsAbsent) {
  struct : platform::AppRegistryObserver {
  } stuck;
  platform.registry.reportGate.close();
  platform.registry.addObserver(stuck);
  platform.registry.reportGate.waitUntilStopped(1);  // The registry's thread goes no further.
  ImpatientClock clock;
  platform.use(clock);
  inProgress = IdentifierList{"com.old"};
  ask();
  EXPECT_EQ(inProgress, std::nullopt);
  EXPECT_EQ(restoring, std::nullopt);
  EXPECT_EQ(clock.lastDeadline, kForever) << "there is no limit of the query's own";
  EXPECT_TRUE(sameLines(LogLines{logged("Waiting for -applicationInstallsArePrioritized:arePaused: to complete..."),
                                 loggedError("Query for in progress assets timed out")},
                        platform.log.lines()));
  EXPECT_EQ(platform.registry.observerCount(), 1U) << "the query observes no longer";
  platform.registry.reportGate.open();
  platform.registry.removeObserver(stuck);
}

TEST_F(InProgressQuery, UnregistersWhateverIsThrown) {
  class ThrowingClock final : public Clock {
   public:
    TimePoint now() const override { return {}; }
    bool wait(std::condition_variable&, std::unique_lock<std::mutex>&, TimePoint,
              const std::function<bool()>&) override {
      throw std::runtime_error("no wait");
    }
  } clock;
  platform.use(clock);
  EXPECT_THROW(ask(), std::runtime_error);
  EXPECT_TRUE(sameLines({"registry.addObserver", "registry.removeObserver"}, platform.journal.lines()));
  EXPECT_EQ(platform.registry.observerCount(), 0U);
}

TEST_F(InProgressQuery, FetchingAfterAReportSucceedsAtOnce) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized({}, {});
  platform.log.clear();
  EXPECT_TRUE(query._fetchResults());
  EXPECT_TRUE(sameLines(LogLines{logged("Waiting for -applicationInstallsArePrioritized:arePaused: to complete..."),
                                 logged("Wait completed")},
                        platform.log.lines()));
}

TEST_F(InProgressQuery, FetchingOnAClockThatGivesUpFails) {
  ImpatientClock clock;
  platform.use(clock);
  InProgressAssetQuery query(platform);
  EXPECT_FALSE(query._fetchResults());
  EXPECT_TRUE(sameLines(LogLines{logged("Waiting for -applicationInstallsArePrioritized:arePaused: to complete..."),
                                 loggedError("Query for in progress assets timed out")},
                        platform.log.lines()));
}

TEST_F(InProgressQuery, BeforeTheFirstReportThereAreNoLists) {
  const InProgressAssetQuery query(platform);
  EXPECT_EQ(query.inProgressAssetIDs(), nullptr);
  EXPECT_EQ(query.restoringAssetIDs(), nullptr);
}

TEST_F(InProgressQuery, AnEmptyReportIsLoggedAndSignalled) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized({}, {});
  EXPECT_TRUE(sameLines(LogLines{loggedIn(14, "prioritized proxies () paused proxies ()"),
                                 logged("No assets currently in progress."), logged("signaling semaphore")},
                        platform.log.lines()));
  ASSERT_NE(query.inProgressAssetIDs(), nullptr);
  ASSERT_NE(query.restoringAssetIDs(), nullptr);
  EXPECT_TRUE(query.inProgressAssetIDs()->empty());
  EXPECT_TRUE(query.restoringAssetIDs()->empty());
}

TEST_F(InProgressQuery, EveryRecordIsLoggedInTheRegistrysOrder) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized(
      {record(FakeApp::installed("com.installed")), record(FakeApp::placeholder("com.idle").withoutProgress()),
       record(active("com.sync", TSInstallType::Sync, TSInstallPhase::Installing)),
       record(active("com.restore", TSInstallType::Restore, TSInstallPhase::Loading)),
       record(FakeApp::placeholder("com.odd", TSInstallType{8}).withProgress(TSInstallState{6}, TSInstallPhase{4}))},
      {record(active("com.paused", TSInstallType::Sync, TSInstallPhase::Installing))});
  EXPECT_TRUE(sameLines(
      LogLines{
          loggedIn(14,
                   "prioritized proxies (com.installed, com.idle, com.sync, com.restore, com.odd) paused proxies "
                   "(com.paused)"),
          logged("No placeholder for asset identifier com.installed"),
          logged("No install progress found for asset identifier com.idle"),
          logged("Got install type=TSInstallTypeSync state=TSInstallStateActive phase=TSInstallPhaseInstalling for "
                 "com.sync"),
          logged("Got install type=TSInstallTypeRestore state=TSInstallStateActive phase=TSInstallPhaseLoading for "
                 "com.restore"),
          logged("Got install type=Unknown Install Type: 8 state=Unknown Install State: 6 phase=Unknown Install Phase: "
                 "4 for com.odd"),
          logged("signaling semaphore"),
      },
      platform.log.lines()));
  EXPECT_EQ(*query.inProgressAssetIDs(), IdentifierList{"com.sync"});
  EXPECT_EQ(*query.restoringAssetIDs(), IdentifierList{"com.restore"});
}

TEST_F(InProgressQuery, ARestoreThatInstallsIsRestoringAndNotInProgress) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized({record(active("com.a", TSInstallType::Restore, TSInstallPhase::Installing))},
                                          {});
  EXPECT_TRUE(query.inProgressAssetIDs()->empty());
  EXPECT_EQ(*query.restoringAssetIDs(), IdentifierList{"com.a"});
}

TEST_F(InProgressQuery, ASyncThatLoadsIsInNeitherListAndAStoreDownloadThatLoadsIsInProgress) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized(
      {record(active("com.sync", TSInstallType::Sync, TSInstallPhase::Loading)),
       record(active("com.store", TSInstallType::StoreDownload, TSInstallPhase::Loading))},
      {});
  EXPECT_EQ(*query.inProgressAssetIDs(), IdentifierList{"com.store"});
  EXPECT_TRUE(query.restoringAssetIDs()->empty());
}

TEST_F(InProgressQuery, PausedInstallsAreNeverLookedAt) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized(
      {}, {record(active("com.a", TSInstallType::Sync, TSInstallPhase::Installing)),
           record(active("com.b", TSInstallType::Restore, TSInstallPhase::Installing))});
  EXPECT_TRUE(query.inProgressAssetIDs()->empty());
  EXPECT_TRUE(query.restoringAssetIDs()->empty());
  EXPECT_TRUE(platform.log.contains(logged("No assets currently in progress.")));
}

TEST_F(InProgressQuery, AnUpdateOfAnInstalledAppCountsAsAPlaceholder) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized(
      {record(FakeApp::updating("com.a").withProgress(TSInstallState::Active, TSInstallPhase::Installing))}, {});
  EXPECT_EQ(*query.inProgressAssetIDs(), IdentifierList{"com.a"});
}

TEST_F(InProgressQuery, ASecondReportChangesNothingAndSignalsNothing) {
  InProgressAssetQuery query(platform);
  query.applicationInstallsArePrioritized({record(active("com.a", TSInstallType::Sync, TSInstallPhase::Installing))},
                                          {});
  platform.log.clear();
  query.applicationInstallsArePrioritized({record(active("com.b", TSInstallType::Sync, TSInstallPhase::Installing))},
                                          {});
  EXPECT_TRUE(sameLines(LogLines{loggedIn(14, "prioritized proxies (com.b) paused proxies ()")}, platform.log.lines()));
  EXPECT_EQ(*query.inProgressAssetIDs(), IdentifierList{"com.a"});
  EXPECT_TRUE(query._fetchResults());
}

TEST_F(InProgressQuery, OnlyOneWaitSucceedsHoweverManyReportsCome) {
  // The query reads its clock's answer only; a clock that never waits shows how many signals there were.
  class NoWaiting final : public Clock {
   public:
    TimePoint now() const override { return {}; }
    bool wait(std::condition_variable&, std::unique_lock<std::mutex>&, TimePoint,
              const std::function<bool()>& ready) override {
      return ready();
    }
  } clock;
  platform.use(clock);
  InProgressAssetQuery query(platform);
  for (int report = 0; report < 3; ++report)
    query.applicationInstallsArePrioritized({}, {});
  EXPECT_TRUE(query._fetchResults());
  EXPECT_FALSE(query._fetchResults());
}

TEST_F(InProgressQuery, TheListsOutliveTheQuery) {
  std::shared_ptr<const IdentifierList> list;
  {
    InProgressAssetQuery query(platform);
    query.applicationInstallsArePrioritized({record(active("com.a", TSInstallType::Sync, TSInstallPhase::Installing))},
                                            {});
    list = query.inProgressAssetIDs();
  }
  EXPECT_EQ(*list, IdentifierList{"com.a"});
}

TEST_F(InProgressQuery, ReportsThatKeepComingWhileItAsksDoNotDisturbIt) {
  platform.registry.add(active("com.a", TSInstallType::Sync, TSInstallPhase::Installing));
  platform.registry.setInstallOrder({"com.a"});
  std::jthread changing([&](const std::stop_token& stop) {
    while (!stop.stop_requested()) {
      platform.registry.setInstallOrder({"com.a"});
      platform.registry.waitUntilReported();
    }
  });
  for (int round = 0; round < 50; ++round) {
    ask();
    EXPECT_EQ(inProgress, IdentifierList{"com.a"});
  }
}

TEST_F(InProgressQuery, WithTheLevelsOffNothingIsWritten) {
  platform.log.disable(8, LogLevel::standard);
  platform.log.disable(14, LogLevel::standard);
  platform.registry.add(active("com.a", TSInstallType::Sync, TSInstallPhase::Installing));
  platform.registry.setInstallOrder({"com.a"});
  ask();
  EXPECT_EQ(inProgress, IdentifierList{"com.a"});
  EXPECT_TRUE(platform.log.lines().empty());
}

}  // namespace appsync::test
