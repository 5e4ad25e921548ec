// Each call of a coordinated restore fails in turn: what is given up, in which order, for which reason.
#include <string>

#include <gtest/gtest.h>

#include "tests/restore/RestoreFixture.h"
#include "tests/support/FatalCall.h"

namespace appsync::test {
namespace {

using platform::CoordinatorKind;
using platform::TransactionPhase;
using platform::TransactionStep;

const std::string kCoordinatorGoes = "coordinator.cancelForReason com.a ZTError 29 3";
const std::string kPlaceholderGoes = "placeholder.cancelForReason com.a ZTError 29 3";
const std::string kIconGoes = "promise.cancelForReason com.a-Icon ZTError 29 3";
const std::string kUserDataGoes = "promise.cancelForReason com.a-UserData ZTError 29 3";

class RestoreFailure : public CoordinatedRestoreFixture, public testing::WithParamInterface<FatalCall> {
 protected:
  /// The lines with which a failed restore ends.
  [[nodiscard]] LogLines ending() const {
    const FatalCall& call = GetParam();
    LogLines lines{logged("processing app restore for com.a finished with status 0 error " +
                          (call.endsWithError ? description(error) : "(null)")),
                   called("transactionLog.logStep 2 com.a n Restore app")};
    for (const std::string& line : call.cancelled) {
      if (line != kCoordinatorGoes && !(line == kPlaceholderGoes && call.cancelled.front() == kCoordinatorGoes))
        continue;
      lines.push_back(logged(std::string("Cancelling ") + (line == kCoordinatorGoes ? "coordinator" : "placeholder") +
                             " for appBundleIdentifier:com.a"));
      lines.push_back(called(line));
    }
    if (call.wasAwaited) {
      lines.push_back(
          logged("DataMigrator cancelled coordinator for restoring app bundle com.a _restoringPlaceholderCount 0"));
    }
    return lines;
  }
};

TEST_P(RestoreFailure, NothingOfThePlugInsOwnIsLeftAndNobodyWaits) {
  const FatalCall& call = GetParam();
  call.failNext(platform, error);
  AppsClient& client = makeTracedClient();
  EXPECT_FALSE(prepare(client));

  call.expectComplaints(platform.log, error);
  call.expectCancellations(platform.journal);
  expectEnd(ending(), platform.log.lines());

  EXPECT_TRUE(platform.coordination.coordinators().empty());
  EXPECT_TRUE(platform.coordination.abandoned().empty());
  EXPECT_EQ(platform.transactions.steps().back(),
            (StepEntry{TransactionStep::restoreApp, TransactionPhase::end, Success::no, "com.a", "Restore app"}));

  platform.log.clear();
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  EXPECT_TRUE(complained("Ignoring notification from CN about installing placeholder for com.a"));
}

INSTANTIATE_TEST_SUITE_P(
    Calls, RestoreFailure,
    testing::Values(FatalCall{"installCoordination.coordinatorForApp",
                              "com.a",
                              {"Error % creating restore coordinator for com.a"},
                              true,
                              {}},
                    FatalCall{"coordinator.setUserDataPromise",
                              "com.a",
                              {"Error % adding out of band data promise for 'com.a'"},
                              true,
                              {kUserDataGoes, kCoordinatorGoes}},
                    FatalCall{"installCoordination.initAppPlaceholder", "com.a", {}, false, {kCoordinatorGoes}},
                    FatalCall{"installCoordination.makePromisedTransferToPath",
                              "com.a-Icon",
                              {},
                              false,
                              {kPlaceholderGoes, kCoordinatorGoes}},
                    FatalCall{"placeholder.setIconPromise",
                              "com.a",
                              {"Error % adding icon promise to placeholder for 'com.a'"},
                              false,
                              {kIconGoes, kPlaceholderGoes, kCoordinatorGoes}},
                    FatalCall{"placeholder.setPlaceholderAttributes",
                              "com.a",
                              {"Error % setting placeholder attributes for 'com.a'"},
                              false,
                              {kPlaceholderGoes, kCoordinatorGoes}},
                    FatalCall{"placeholder.setMetadata",
                              "com.a",
                              {"Error % setting store metadata for 'com.a'"},
                              false,
                              {kPlaceholderGoes, kCoordinatorGoes}},
                    FatalCall{"placeholder.setSinfData",
                              "com.a",
                              {"Error % setting SINF data for 'com.a'"},
                              false,
                              {kPlaceholderGoes, kCoordinatorGoes}},
                    FatalCall{"placeholder.setConfigurationComplete",
                              "com.a",
                              {"Error % setting placeholder configuration as complete for 'com.a'"},
                              false,
                              {kPlaceholderGoes, kCoordinatorGoes}},
                    FatalCall{"coordinator.setPlaceholderPromise",
                              "com.a",
                              {"Error % setting placeholder promise for 'com.a'"},
                              true,
                              {kCoordinatorGoes, kPlaceholderGoes}},
                    FatalCall{"coordinator.setAppAssetPromiseResponsibleClient",
                              "com.a",
                              {"Error % setting CXClientBazaarly to satisfy app data promise for 'com.a'"},
                              true,
                              {kCoordinatorGoes},
                              true}),
    nameOfCall);

class RestoreFaults : public CoordinatedRestoreFixture {};

TEST_F(RestoreFaults, ADemotedAppsFailureIsToldAsOne) {
  platform.coordination.failures.failNext("coordinator.setPlaceholderPromise", "com.a", error);
  EXPECT_FALSE(prepare(DemotionStatus::automaticallyDemoted));
  expectEnd({logged("processing app restore for demoted app com.a finished with status 0 error " + description(error)),
             called("transactionLog.logStep 2 com.a n Restore demoted app"),
             logged("Cancelling coordinator for appBundleIdentifier:com.a"), called(kCoordinatorGoes),
             logged("Cancelling placeholder for appBundleIdentifier:com.a"), called(kPlaceholderGoes)},
            platform.log.lines());
}

/// An app that another run has announced is withdrawn by whatever fails now.
TEST_F(RestoreFaults, AFailureAfterAnEarlierAnnouncementWithdrawsTheApp) {
  AppsClient& client = makeTracedClient();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  platform.coordination.failures.failNext("installCoordination.coordinatorForApp", "com.a", error);
  EXPECT_FALSE(prepare(client));
  EXPECT_TRUE(said("DataMigrator cancelled coordinator for restoring app bundle com.a _restoringPlaceholderCount 0"));
}

TEST_F(RestoreFaults, APlaceholderThatTheCoordinatorRefusesLeavesTheCountAsItWas) {
  AppsClient& client = makeTracedClient();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.b");
  platform.coordination.failures.failNext("coordinator.setPlaceholderPromise", "com.a", error);
  platform.log.clear();
  EXPECT_FALSE(prepare(client));
  EXPECT_EQ(cancellation(), givenUp);
  EXPECT_EQ(platform.coordination.placeholder("com.a")->cancellation, givenUp);
  for (const std::string& message : platform.log.messages())
    EXPECT_EQ(message.find("DataMigrator"), std::string::npos) << message;
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.b");
  EXPECT_TRUE(said("DataMigrator cancelled coordinator for restoring app bundle com.b _restoringPlaceholderCount 0"));
}

TEST_F(RestoreFaults, AnInterruptedRunsCoordinatorGoesWithWhatItHad) {
  FakePlaceholder placeholder;
  placeholder.identifier = "com.a";
  platform.coordination.add(FakeCoordinator::of("com.a", CoordinatorKind::restoring).withPlaceholder(placeholder));
  platform.coordination.failures.failNext("coordinator.setAppAssetPromiseResponsibleClient", "com.a", error);
  EXPECT_FALSE(prepare());
  EXPECT_EQ(cancellation(), givenUp);
  EXPECT_EQ(platform.journal.count("placeholder.cancelForReason"), 0U);
}

/// Of a restore that fails the count is what it was, of one that succeeds one more; the count and the group agree.
TEST_F(RestoreFaults, WhicheverCallFailsNothingIsLeftHalfwayAndTheCountAgrees) {
  for (const DemotionStatus status : {DemotionStatus::notDemoted, DemotionStatus::intentionallyDemoted}) {
    AppsClient& client = makeClient();
    const std::size_t before = platform.journal.callCount();
    EXPECT_TRUE(prepare(client, status));
    const std::size_t calls = platform.journal.callCount() - before;
    EXPECT_GT(calls, 25U);
    for (std::size_t number = 1; number <= calls; ++number) {
      SCOPED_TRACE("call " + std::to_string(number) + " of " + std::to_string(calls));
      for (const FakeCoordinator& coordinator : platform.coordination.coordinators())
        platform.coordination.cancel(coordinator.identifier, {error, kSync});
      client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
      platform.files.erase(kAppFolder);
      platform.journal.failCall(number, error);
      const bool isReady = client.prepareAppForRestoreUsingCoordination("com.a", metadata, sinf, icon, status);
      platform.journal.setHook(nullptr);
      const auto left = platform.coordination.coordinator("com.a");
      EXPECT_EQ(left.has_value(), isReady);
      EXPECT_TRUE(platform.coordination.abandoned().empty());
      EXPECT_TRUE(!left || left->placeholder);

      platform.log.clear();
      client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.counted");
      EXPECT_TRUE(
          said("DataMigrator will wait for CN to install placeholder for com.counted, "
               "_restoringPlaceholderCount " +
               std::to_string(isReady ? 2 : 1)));
      client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.counted");
    }
    for (const FakeCoordinator& coordinator : platform.coordination.coordinators())
      platform.coordination.cancel(coordinator.identifier, {error, kSync});
    client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
  }
}

/// A coordinator that cannot even be cancelled is the service's to end: what is the plug-in's alone goes all the same.
TEST_F(RestoreFaults, ACancellationThatFailsToo) {
  platform.coordination.failures.failNext("coordinator.setPlaceholderPromise", "com.a", error);
  platform.coordination.failures.failNext("coordinator.cancelForReason", "com.a", error);
  EXPECT_FALSE(prepare());
  EXPECT_TRUE(platform.coordination.abandoned().empty());
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
}

}  // namespace
}  // namespace appsync::test
