// Which wanted apps the host need not send after all, and why.
#include <string>

#include <gtest/gtest.h>

#include "kit/fakes/FakeSyncFramework.h"
#include "transfer/SkipRules.h"

namespace appsync::test {
namespace {

class SkipRules : public testing::Test {
 protected:
  void expectSkipped(std::string_view message) {
    EXPECT_TRUE(isSkipped(candidate_, PlugInLog(framework_)));
    EXPECT_TRUE(sameLines({logged(message)}, log_.lines()));
  }

  CallJournal journal_;
  RecordingLog log_;
  FakeSyncFramework framework_{journal_, log_};
  TransferCandidate candidate_{.identifier = "com.a"};
};

TEST_F(SkipRules, AnOrdinaryAppIsSentWithoutAWord) {
  EXPECT_FALSE(isSkipped(candidate_, PlugInLog(framework_)));
  EXPECT_TRUE(log_.lines().empty());
}

TEST_F(SkipRules, WhereInstallationIsForbiddenOnlyRestoresAreSent) {
  candidate_.installationIsAllowed = false;
  expectSkipped("skipping com.a - its not a restore and app installation is disabled");
  candidate_.isRestore = true;
  EXPECT_FALSE(isSkipped(candidate_, PlugInLog(framework_)));
}

TEST_F(SkipRules, ARestoreThatThisSyncMustLeaveAloneIsSkipped) {
  candidate_.isToBeIgnored = true;
  EXPECT_FALSE(isSkipped(candidate_, PlugInLog(framework_)));
  candidate_.isRestore = true;
  expectSkipped("com.a is currenlty marked as to be ignored for download - skipping");
}

TEST_F(SkipRules, UnderCoordinationTheStoreSendsRestores) {
  candidate_.isRestore = candidate_.usesInstallCoordinator = true;
  expectSkipped("com.a is currenlty marked to be restored and will be handled by bazaarlyd - skipping");
}

TEST_F(SkipRules, UnderCoordinationSystemAppsAreSkipped) {
  candidate_.isSystemApp = true;
  EXPECT_FALSE(isSkipped(candidate_, PlugInLog(framework_)));
  candidate_.usesInstallCoordinator = candidate_.isIntentionallyDemoted = true;
  expectSkipped("com.a is auto demoted: 0, manual demoted: 1, system app:1 - skipping");
}

TEST_F(SkipRules, PlaceholdersOfSystemAppsAreSkipped) {
  candidate_.isSystemAppPlaceholder = true;
  expectSkipped("com.a is system app placeholder - skipping");
}

TEST_F(SkipRules, UnderCoordinationADemotedAppIsSkippedUnlessTheHostAsksForIt) {
  candidate_.isAutomaticallyDemoted = true;
  EXPECT_FALSE(isSkipped(candidate_, PlugInLog(framework_)));
  candidate_.usesInstallCoordinator = true;
  // The automatic flag stands first, whatever the words say.
  expectSkipped("com.a is currenlty demoted (manual:1, auto:0) - skipping");

  log_.clear();
  candidate_.isRequestedByHost = true;
  EXPECT_FALSE(isSkipped(candidate_, PlugInLog(framework_)));
  EXPECT_TRUE(sameLines(
      {logged("com.a is currenlty demoted (manual:1, auto:0) - but will be installed as it's requested by client")},
      log_.lines()));
}

TEST_F(SkipRules, TheFirstRuleThatAppliesDecides) {
  candidate_ = {.identifier = "com.a",
                .isRestore = true,
                .isAutomaticallyDemoted = true,
                .isIntentionallyDemoted = true,
                .isSystemApp = true,
                .installationIsAllowed = false,
                .usesInstallCoordinator = true,
                .isToBeIgnored = true,
                .isSystemAppPlaceholder = true,
                .isRequestedByHost = false};
  expectSkipped("com.a is currenlty marked as to be ignored for download - skipping");
  log_.clear();
  candidate_.isToBeIgnored = false;
  expectSkipped("com.a is currenlty marked to be restored and will be handled by bazaarlyd - skipping");
  log_.clear();
  candidate_.isRestore = false;
  expectSkipped("skipping com.a - its not a restore and app installation is disabled");
  log_.clear();
  candidate_.installationIsAllowed = true;
  expectSkipped("com.a is auto demoted: 1, manual demoted: 1, system app:1 - skipping");
  log_.clear();
  candidate_.isSystemApp = false;
  expectSkipped("com.a is system app placeholder - skipping");
  log_.clear();
  candidate_.isSystemAppPlaceholder = false;
  expectSkipped("com.a is currenlty demoted (manual:1, auto:1) - skipping");
}

}  // namespace
}  // namespace appsync::test
