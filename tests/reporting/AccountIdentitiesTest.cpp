// The store accounts that own the apps on the device.
#include <set>
#include <string>

#include <gtest/gtest.h>

#include "tests/reporting/StoreMetadataFixture.h"

namespace appsync::test {
namespace {

using Identifiers = std::set<std::string>;
using platform::ZTAccountInfos;

class AccountIdentities : public StoreMetadataFixture {
 protected:
  Identifiers identifiers() { return makeClient().corvelIDsForAssets(); }
  ZTAccountInfos accounts() { return makeClient().accountsForAssets(); }
};

// Identifiers.

TEST_F(AccountIdentities, IdentifiersComeFromOneWalkInWhichEachFileIsReadOnce) {
  addApp("com.a", metadataOf("x", plist::Dictionary{{"CorvelID", "x"}}));
  addApp("com.b", metadataOf(plist::Dictionary{{"CorvelID", "y"}}));
  AppsClient& client = makeClient();
  logCalls(platform);
  EXPECT_EQ(client.corvelIDsForAssets(), (Identifiers{"x", "y"}));
  EXPECT_TRUE(sameLines({logged("getting id's for assets"), called("registry.enumerateBundlesOfType 1"),
                         called("fileSystem.readFile " + pathOf("com.a")),
                         called("fileSystem.readFile " + pathOf("com.b")), logged("Returning corvel ID set: (x, y)")},
                        platform.log.lines()));
}

TEST_F(AccountIdentities, WithoutAppsThereAreNone) {
  EXPECT_EQ(identifiers(), Identifiers{});
  EXPECT_TRUE(
      sameLines({logged("getting id's for assets"), logged("Returning corvel ID set: ()")}, platform.log.lines()));
}

TEST_F(AccountIdentities, EitherPlaceAloneGivesTheIdentifier) {
  addApp("com.a", plist::Dictionary{{"corvelId", "older"}});
  addApp("com.b", metadataOf(plist::Dictionary{{"CorvelID", "newer"}}));
  EXPECT_EQ(identifiers(), (Identifiers{"newer", "older"}));
  EXPECT_EQ(platform.log.lines().size(), 2U);
}

TEST_F(AccountIdentities, TwoDifferentIdentifiersOfAnAppAreToldAndBothReported) {
  addApp("com.a", metadataOf("x", plist::Dictionary{{"CorvelID", "y"}}));
  EXPECT_EQ(identifiers(), (Identifiers{"x", "y"}));
  EXPECT_TRUE(sameLines({logged("getting id's for assets"), logged("mismatched CorvelID keys for com.a: x vs y"),
                         logged("Returning corvel ID set: (x, y)")},
                        platform.log.lines()));
}

TEST_F(AccountIdentities, AnIdentifierOfAnotherTypeIsToldAndTheOlderPlaceAloneCounts) {
  addApp("com.a", metadataOf("x", plist::Dictionary{{"CorvelID", 7}}));
  EXPECT_EQ(identifiers(), Identifiers{"x"});
  EXPECT_TRUE(
      sameLines({logged("getting id's for assets"), unexpectedType("CorvelID"), logged("Returning corvel ID set: (x)")},
                platform.log.lines()));
}

TEST_F(AccountIdentities, AnAppWithoutAFileIsToldWithThePlaceOfTheFile) {
  addApp("com.a");
  EXPECT_EQ(identifiers(), Identifiers{});
  EXPECT_TRUE(
      sameLines({logged("getting id's for assets"), unknownAccountOf("com.a"), logged("Returning corvel ID set: ()")},
                platform.log.lines()));
}

TEST_F(AccountIdentities, AnAppWithoutAContainerHasNoFile) {
  platform.registry.add(FakeApp::installed("com.a").withContainerPath(std::nullopt));
  EXPECT_EQ(identifiers(), Identifiers{});
  EXPECT_TRUE(platform.log.contains(logged("unknown CorvelID for com.a (plist at (null))")));
  EXPECT_EQ(accounts(), ZTAccountInfos{});
  EXPECT_EQ(platform.journal.count("fileSystem."), 0U);
}

TEST_F(AccountIdentities, TheSameIdentifierOfManyAppsIsReportedOnce) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    addApp(identifier, plist::Dictionary{{"corvelId", "x"}});
  EXPECT_EQ(identifiers(), Identifiers{"x"});
}

TEST_F(AccountIdentities, IdentifiersAreReportedAsTheyWereFound) {
  addApp("com.a", plist::Dictionary{{"corvelId", "x"}});
  addApp("com.b", plist::Dictionary{{"corvelId", "X"}});
  addApp("com.c", plist::Dictionary{{"corvelId", " x\n"}});
  addApp("com.d", plist::Dictionary{{"corvelId", ""}});
  EXPECT_EQ(identifiers(), (Identifiers{"", " x\n", "X", "x"}));
  EXPECT_EQ(accounts(), (ZTAccountInfos{account(""), account(" x\n"), account("X"), account("x")}));
}

TEST_F(AccountIdentities, TheKeysAreExact) {
  addApp("com.a", plist::Dictionary{{"CorvelID", "x"}, {"corvelID", "x"}, {"accountInfo", plist::Dictionary{}}});
  addApp("com.b", metadataOf(plist::Dictionary{{"corvelId", "x"}}));
  EXPECT_EQ(identifiers(), Identifiers{});
  EXPECT_EQ(accounts(), ZTAccountInfos{});
}

// Accounts.

TEST_F(AccountIdentities, AccountsComeFromOneWalkInWhichEachFileIsReadOnce) {
  addApp("com.a", metadataOf(plist::Dictionary{{"CorvelID", "x"}, {"DSPersonID", 7}, {"AltDSID", "000-7"}}));
  addApp("com.b", plist::Dictionary{{"corvelId", "y"}});
  AppsClient& client = makeClient();
  logCalls(platform);
  EXPECT_EQ(client.accountsForAssets(), (ZTAccountInfos{account("x", 7, "000-7"), account("y")}));
  EXPECT_TRUE(
      sameLines({logged("getting accounts for assets"), called("registry.enumerateBundlesOfType 1"),
                 called("fileSystem.readFile " + pathOf("com.a")), called("fileSystem.readFile " + pathOf("com.b")),
                 logged("Returning accountInfo: (<ZTMutableAccountInfo corvelID x DSID 7 altDSID 000-7>, "
                        "<ZTMutableAccountInfo corvelID y DSID (null) altDSID (null)>)")},
                platform.log.lines()));
}

TEST_F(AccountIdentities, WithoutAppsThereAreNoAccounts) {
  EXPECT_EQ(accounts(), ZTAccountInfos{});
  EXPECT_TRUE(
      sameLines({logged("getting accounts for assets"), logged("Returning accountInfo: ()")}, platform.log.lines()));
}

TEST_F(AccountIdentities, TheNewerPlaceWinsAndTheTwoAreNotCompared) {
  addApp("com.a", metadataOf("x", plist::Dictionary{{"CorvelID", "y"}}));
  EXPECT_EQ(accounts(), ZTAccountInfos{account("y")});
  EXPECT_EQ(platform.log.lines().size(), 2U);
}

TEST_F(AccountIdentities, TheOlderPlaceIsLookedAtOnlyForWantOfTheNewer) {
  addApp("com.a", metadataOf(7, plist::Dictionary{{"CorvelID", "y"}}));
  EXPECT_EQ(accounts(), ZTAccountInfos{account("y")});
  EXPECT_TRUE(platform.log.lines(0).empty());
  addApp("com.b", metadataOf(7, plist::Dictionary{{"CorvelID", 8}}));
  EXPECT_EQ(accounts(), ZTAccountInfos{account("y")});
  EXPECT_TRUE(sameLines({unexpectedType("CorvelID"), unexpectedType("corvelID")}, platform.log.lines(0)));
}

TEST_F(AccountIdentities, AnAccountWithTheIdentifierInItsOlderPlaceHasTheRestFromTheNewer) {
  addApp("com.a", metadataOf("x", plist::Dictionary{{"DSPersonID", 7}, {"AltDSID", "000-7"}}));
  EXPECT_EQ(accounts(), ZTAccountInfos{account("x", 7, "000-7")});
}

TEST_F(AccountIdentities, OfTwoAppsOfOneAccountTheFirstSuppliesTheRest) {
  addApp("com.a", metadataOf(plist::Dictionary{{"CorvelID", "x"}, {"DSPersonID", 1}}));
  addApp("com.b", metadataOf(plist::Dictionary{{"CorvelID", "x"}, {"DSPersonID", 2}, {"AltDSID", "000-2"}}));
  EXPECT_EQ(accounts(), ZTAccountInfos{account("x", 1)});
}

TEST_F(AccountIdentities, NothingMoreIsLookedUpOfAnAccountThatIsKnown) {
  addApp("com.a", metadataOf(plist::Dictionary{{"CorvelID", "x"}}));
  addApp("com.b", metadataOf(plist::Dictionary{{"CorvelID", "x"}, {"DSPersonID", "2"}, {"AltDSID", 2}}));
  EXPECT_EQ(accounts(), ZTAccountInfos{account("x")});
  EXPECT_TRUE(platform.log.lines(0).empty());
}

TEST_F(AccountIdentities, AnAppWithoutAFileIsSkippedSilently) {
  addApp("com.a");
  addApp("com.b", plist::Dictionary{{"corvelId", "x"}});
  EXPECT_EQ(accounts(), ZTAccountInfos{account("x")});
  EXPECT_EQ(platform.log.lines().size(), 2U);
}

TEST_F(AccountIdentities, APersonIdentifierThatIsTextIsToldAndTheAccountHasNone) {
  addApp("com.a", metadataOf(plist::Dictionary{{"CorvelID", "x"}, {"DSPersonID", "7"}, {"AltDSID", "000-7"}}));
  EXPECT_EQ(accounts(), ZTAccountInfos{account("x", std::nullopt, "000-7")});
  EXPECT_TRUE(sameLines({unexpectedType("DSPersonID")}, platform.log.lines(0)));
}

TEST_F(AccountIdentities, AnyNumberIsAPersonIdentifier) {
  const plist::Array numbers{-7, 0xFFFF'FFFF'FFFF'FFFFU, 7.5};
  for (std::size_t index = 0; index < numbers.size(); ++index) {
    const std::string letter(1, static_cast<char>('a' + index));
    addApp("com." + letter, metadataOf(plist::Dictionary{{"CorvelID", letter}, {"DSPersonID", numbers[index]}}));
  }
  EXPECT_EQ(accounts(), (ZTAccountInfos{account("a", numbers[0]), account("b", numbers[1]), account("c", numbers[2])}));
}

// Both.

TEST_F(AccountIdentities, ABundleThatIsNoAppIsPassedOver) {
  platform.registry.addBundle("com.extension", platform::BundleKind::user);
  EXPECT_EQ(identifiers(), Identifiers{});
  EXPECT_EQ(accounts(), ZTAccountInfos{});
  EXPECT_EQ(platform.log.lines().size(), 4U);
}

TEST_F(AccountIdentities, EveryRecordOfTheWalkIsLookedAtWhateverItsType) {
  platform.registry.add(FakeApp::placeholder("com.a").ofType("Internal").metByWalksOf(platform::BundleKind::user));
  putPropertyList(platform.files, pathOf("com.a"), plist::Dictionary{{"corvelId", "x"}});
  EXPECT_EQ(identifiers(), Identifiers{"x"});
  EXPECT_EQ(accounts(), ZTAccountInfos{account("x")});
}

TEST_F(AccountIdentities, NoFileIsEverWritten) {
  addApp("com.a", metadataOf("x", plist::Dictionary{{"CorvelID", "y"}}));
  const auto before = platform.files.contents(pathOf("com.a"));
  static_cast<void>(identifiers());
  static_cast<void>(accounts());
  EXPECT_EQ(platform.files.contents(pathOf("com.a")), before);
  EXPECT_EQ(platform.files.writes(pathOf("com.a")), 0U);
}

}  // namespace
}  // namespace appsync::test
