// Which restored apps were demoted, and how.
#include <cerrno>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "restore/DemotedApps.h"
#include "tests/restore/RestoreFixture.h"

namespace appsync::test {
namespace {

TEST(DemotedApps, AnAppInBothListsWasDemotedAutomatically) {
  const DemotedApps apps(plist::Dictionary{{"AutomaticDowngrades", plist::Array{"com.auto", "com.both"}},
                                           {"IntentionalDowngrades", plist::Array{"com.both", "com.user"}}});
  EXPECT_EQ(apps.statusOf("com.both"), DemotionStatus::automaticallyDemoted);
  EXPECT_EQ(apps.statusOf("com.auto"), DemotionStatus::automaticallyDemoted);
  EXPECT_EQ(apps.statusOf("com.user"), DemotionStatus::intentionallyDemoted);
  EXPECT_EQ(apps.statusOf("com.other"), DemotionStatus::notDemoted);
  EXPECT_EQ(apps.statusOf("COM.AUTO"), DemotionStatus::notDemoted);
}

TEST(DemotedApps, WithoutListsNothingIsDemoted) {
  EXPECT_EQ(DemotedApps(std::nullopt).statusOf("com.a"), DemotionStatus::notDemoted);
  EXPECT_EQ(DemotedApps(plist::Dictionary{}).statusOf("com.a"), DemotionStatus::notDemoted);
}

TEST(DemotedApps, AListOfAnotherTypeIsAbsentAndElementsOfAnotherTypeArePassedOver) {
  const DemotedApps apps(plist::Dictionary{{"AutomaticDowngrades", "com.a"},
                                           {"IntentionalDowngrades", plist::Array{7, plist::Array{"com.b"}, "com.a"}}});
  EXPECT_EQ(apps.statusOf("com.a"), DemotionStatus::intentionallyDemoted);
  EXPECT_EQ(apps.statusOf("com.b"), DemotionStatus::notDemoted);
}

class DemotedAppsFile : public RestoreFixture {
 protected:
  std::optional<plist::Dictionary> load() {
    makeClient();
    return AppsClient::_loadDemotedAppsPlist(platform, kDemotedApps, &slot);
  }

  std::optional<Error> slot;
};

TEST_F(DemotedAppsFile, IsReadWhateverItsForm) {
  const plist::Dictionary lists{{"AutomaticDowngrades", plist::Array{"com.a"}}};
  for (const Bytes& document : {binaryForm(lists), xmlForm(lists)}) {
    platform.files.put(kDemotedApps, document);
    EXPECT_EQ(load(), lists);
  }
  EXPECT_TRUE(platform.log.lines().empty());
  EXPECT_EQ(slot, std::nullopt);
}

TEST_F(DemotedAppsFile, AMissingOneYieldsNothingAndTheErrorWithoutAMessage) {
  EXPECT_EQ(load(), std::nullopt);
  EXPECT_TRUE(slot);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(DemotedAppsFile, AnEmptyOneYieldsNothingWithoutAMessage) {
  platform.files.put(kDemotedApps, "");
  EXPECT_EQ(load(), std::nullopt);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(DemotedAppsFile, ATruncatedOneIsAnError) {
  const Bytes whole = binaryForm(plist::Dictionary{{"AutomaticDowngrades", plist::Array{"com.a"}}});
  platform.files.put(kDemotedApps, ByteView(whole).first(whole.size() / 2));
  EXPECT_EQ(load(), std::nullopt);
  EXPECT_TRUE(sameLines({loggedError("couldn't parse demoted apps list")}, platform.log.lines()));
}

TEST_F(DemotedAppsFile, SetsErrorSlotForFailedReadOnly) {
  platform.files.put(kDemotedApps, "bplist00");
  EXPECT_EQ(load(), std::nullopt);
  EXPECT_EQ(slot, std::nullopt);
  putPropertyList(platform.files, kDemotedApps, plist::Array{"com.a"});
  EXPECT_EQ(load(), std::nullopt);
  EXPECT_EQ(slot, std::nullopt);
  const Error denied = Error::fromErrno(EACCES, kDemotedApps);
  platform.files.failures.failNext(FileOperation::readFile, kDemotedApps, denied);
  EXPECT_EQ(load(), std::nullopt);
  EXPECT_EQ(slot, denied);
}

TEST_F(DemotedAppsFile, AnArrayIsAnError) {
  putPropertyList(platform.files, kDemotedApps, plist::Array{"com.a"});
  EXPECT_EQ(load(), std::nullopt);
  EXPECT_TRUE(sameLines({loggedError("demoted apps list is not a dictionary")}, platform.log.lines()));
}

/// A restore goes on with every app as if it had not been demoted.
TEST_F(DemotedAppsFile, ABadOneMakesEveryAppNotDemoted) {
  platform.files.put(kDemotedApps, "bplist00");
  putRestoreInfo({{"com.a", restoredApp()}});
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  EXPECT_TRUE(said("processing harvo restore info for 'com.a' demotionStatus :0"));
  EXPECT_TRUE(platform.log.contains(loggedIn(14, "Demoted Apps: (null)")));
}

TEST_F(DemotedAppsFile, TheWholeFileStandsInTheSummary) {
  putDemotedApps({"com.auto", "com.both"}, {"com.both"});
  putRestoreInfo({{"com.both", restoredApp()}});
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  EXPECT_TRUE(platform.log.contains(
      loggedIn(14, "Demoted Apps: {AutomaticDowngrades = (com.auto, com.both); IntentionalDowngrades = (com.both);}")));
  EXPECT_TRUE(said("processing harvo restore info for 'com.both' demotionStatus :2"));
}

}  // namespace
}  // namespace appsync::test
