// Counting restore placeholders that are still awaited.
#include <string>

#include <gtest/gtest.h>

#include "kit/fakes/Threads.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

class RestorePlaceholderCounter : public ClientFixture {
 protected:
  AppsClient& make() {
    AppsClient& client = makeClient();
    platform.log.clear();
    return client;
  }
};

LogLine awaited(const std::string& identifier, int count) {
  return logged("DataMigrator will wait for CN to install placeholder for " + identifier +
                ", _restoringPlaceholderCount " + std::to_string(count));
}

LogLine withdrawn(const std::string& identifier, int count) {
  return logged("DataMigrator cancelled coordinator for restoring app bundle " + identifier +
                " _restoringPlaceholderCount " + std::to_string(count));
}

LogLine installed(const std::string& identifier, int count) {
  return logged("CN finished installing placeholder for " + identifier + ", _restoringPlaceholderCount " +
                std::to_string(count));
}

LogLine ignored(const std::string& identifier) {
  return loggedError("Ignoring notification from CN about installing placeholder for " + identifier);
}

TEST_F(RestorePlaceholderCounter, EachPlaceholderIsCountedUpAndOff) {
  AppsClient& client = make();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.b");
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.b");
  EXPECT_TRUE(sameLines({awaited("com.a", 1), awaited("com.b", 2), installed("com.a", 1), withdrawn("com.b", 0)},
                        platform.log.lines()));
}

TEST_F(RestorePlaceholderCounter, ASecondAnnouncementLeavesTheCountAtOne) {
  AppsClient& client = make();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.b");
  EXPECT_TRUE(sameLines({awaited("com.a", 1), awaited("com.b", 2)}, platform.log.lines()));
}

TEST_F(RestorePlaceholderCounter, APlaceholderThatNobodyAnnouncedIsAnError) {
  make().cnDidInstallPlaceHolderForAppBundle("com.a");
  EXPECT_TRUE(sameLines({ignored("com.a")}, platform.log.lines()));
}

TEST_F(RestorePlaceholderCounter, AnAppLeavesTheCountOnce) {
  AppsClient& client = make();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
  EXPECT_TRUE(sameLines({awaited("com.a", 1), installed("com.a", 0), ignored("com.a")}, platform.log.lines()));
}

TEST_F(RestorePlaceholderCounter, AWithdrawalOfAnUnknownAppIsSilent) {
  make().dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(RestorePlaceholderCounter, AnAppThatHasComeMayBeAwaitedAnew) {
  AppsClient& client = make();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  EXPECT_TRUE(sameLines({awaited("com.a", 1), installed("com.a", 0), awaited("com.a", 1), installed("com.a", 0)},
                        platform.log.lines()));
}

TEST_F(RestorePlaceholderCounter, InsideTheDaemonReportsNeverCountAndWithdrawalsDo) {
  AppsClient& client = makeDaemonClient();
  platform.log.clear();
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  client.cnDidInstallPlaceHolderForAppBundle("com.a");
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
  EXPECT_TRUE(sameLines({awaited("com.a", 1), withdrawn("com.a", 0)}, platform.log.lines()));
}

TEST_F(RestorePlaceholderCounter, AnObjectThatGoesNamesThePlaceholdersThatNeverCame) {
  AppsClient& client = make();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.b");
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  platform.log.clear();
  takeClient().reset();
  EXPECT_TRUE(sameLines(
      {loggedError(
          "<AppsClient> getting dealloc'd with (com.a, com.b)pending placeholder install complete notifications")},
      platform.log.lines()));
}

TEST_F(RestorePlaceholderCounter, ReportsFromManyThreadsAreAllCounted) {
  constexpr std::size_t kApps = 16;
  AppsClient& client = make();
  runOnThreads(kApps, [&](std::size_t number) {
    const std::string identifier = "com.app" + std::to_string(number);
    client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(identifier);
    client.cnDidInstallPlaceHolderForAppBundle(identifier);
  });
  platform.log.clear();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.last");
  EXPECT_TRUE(sameLines({awaited("com.last", 1)}, platform.log.lines()));
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.last");
}

}  // namespace
}  // namespace appsync::test
