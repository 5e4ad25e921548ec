// Store metadata that no store wrote: it costs its own app's answer, and no other's.
#include <cstddef>
#include <initializer_list>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "reporting/UserApps.h"
#include "tests/reporting/StoreMetadataFixture.h"

namespace appsync::test {
namespace {

using Identifiers = std::set<std::string>;
using platform::ZTAccountInfos;

/// Of three apps the one in the middle has what a test puts there.
class HostileStoreMetadata : public StoreMetadataFixture {
 protected:
  HostileStoreMetadata() {
    addApp("com.1", plist::Dictionary{{"corvelId", "first"}, {"is-auto-download", true}});
    addApp("com.2");
    addApp("com.3", plist::Dictionary{{"corvelId", "last"}, {"is-auto-download", true}});
  }

  void put(const plist::Value& metadata) { platform.files.put(kPath, binaryForm(metadata)); }

  /// That the file names no account, changes nothing and stops no walk.
  void expectNoAccount() {
    AppsClient& client = makeClient();
    EXPECT_EQ(client.corvelIDsForAssets(), (Identifiers{"first", "last"}));
    EXPECT_TRUE(platform.log.contains(unknownAccountOf("com.2")));
    EXPECT_EQ(client.accountsForAssets(), (ZTAccountInfos{account("first"), account("last")}));
    EXPECT_LE(reads(), 2U);
    client.prepareForBackup();
    EXPECT_EQ(platform.files.writes(pathOf("com.3")), 1U);
    EXPECT_EQ(platform.files.writes(kPath), 0U);
  }
  [[nodiscard]] std::size_t reads() const { return platform.journal.count("fileSystem.readFile " + kPath); }

  const std::string kPath = pathOf("com.2");
};

/// Everything that a property list can hold but a string, a number or a dictionary.
plist::Array oddValues() {
  return {true, plist::Value::data(bytesOf("x")), plist::Date{1}, plist::Uid{7}, plist::Array{"x"}};
}

/// The same with `more`.
plist::Array oddValuesAnd(std::initializer_list<plist::Value> more) {
  plist::Array values = oddValues();
  values.insert(values.end(), more);
  return values;
}

const plist::Value kText = "x";
const plist::Value kNumber = 7;
const plist::Value kDictionary = plist::Dictionary{{"CorvelID", "x"}};

TEST_F(HostileStoreMetadata, AnOlderIdentifierOfEveryOtherTypeIsNone) {
  for (const plist::Value& odd : oddValuesAnd({kNumber, kDictionary})) {
    put(plist::Dictionary{{"corvelId", odd}});
    expectNoAccount();
    EXPECT_TRUE(sameLines({unexpectedType("corvelID"), unexpectedType("corvelID")}, platform.log.lines(0)));
    platform.log.clear();
  }
}

TEST_F(HostileStoreMetadata, DownloadInformationOfEveryOtherTypeIsNone) {
  for (const plist::Value& odd : oddValuesAnd({kText, kNumber})) {
    put(plist::Dictionary{{"com.corvel.HarvoStore.downloadInfo", odd}});
    expectNoAccount();
    EXPECT_TRUE(sameLines({unexpectedType("downloadInfo"), unexpectedType("downloadInfo")}, platform.log.lines(0)));
    platform.log.clear();
  }
}

TEST_F(HostileStoreMetadata, AnAccountOfEveryOtherTypeIsNone) {
  for (const plist::Value& odd : oddValuesAnd({kText, kNumber})) {
    put(metadataOf(odd));
    expectNoAccount();
    EXPECT_TRUE(sameLines({unexpectedType("accountInfo"), unexpectedType("accountInfo")}, platform.log.lines(0)));
    platform.log.clear();
  }
}

TEST_F(HostileStoreMetadata, ANewerIdentifierOfEveryOtherTypeIsNone) {
  for (const plist::Value& odd : oddValuesAnd({kNumber, kDictionary})) {
    put(metadataOf(plist::Dictionary{{"CorvelID", odd}}));
    expectNoAccount();
    EXPECT_TRUE(sameLines({unexpectedType("CorvelID"), unexpectedType("CorvelID")}, platform.log.lines(0)));
    platform.log.clear();
  }
}

TEST_F(HostileStoreMetadata, APersonIdentifierOfEveryOtherTypeIsNone) {
  for (const plist::Value& odd : oddValuesAnd({kText, kDictionary})) {
    put(metadataOf(plist::Dictionary{{"CorvelID", "x"}, {"DSPersonID", odd}}));
    EXPECT_EQ(makeClient().accountsForAssets(), (ZTAccountInfos{account("first"), account("last"), account("x")}));
    EXPECT_TRUE(sameLines({unexpectedType("DSPersonID")}, platform.log.lines(0)));
    platform.log.clear();
  }
}

TEST_F(HostileStoreMetadata, AnAlternativeIdentifierOfEveryOtherTypeIsNone) {
  for (const plist::Value& odd : oddValuesAnd({kNumber, kDictionary})) {
    put(metadataOf(plist::Dictionary{{"CorvelID", "x"}, {"DSPersonID", 7}, {"AltDSID", odd}}));
    EXPECT_EQ(makeClient().accountsForAssets(), (ZTAccountInfos{account("first"), account("last"), account("x", 7)}));
    EXPECT_TRUE(sameLines({unexpectedType("AltDSID")}, platform.log.lines(0)));
    platform.log.clear();
  }
}

TEST_F(HostileStoreMetadata, EveryWrongTypeOfAnAppIsToldInTheOrderOfTheLookups) {
  put(plist::Dictionary{{"corvelId", 7},
                        {"com.corvel.HarvoStore.downloadInfo",
                         plist::Dictionary{{"accountInfo", plist::Dictionary{{"CorvelID", 7}, {"AltDSID", 7}}}}}});
  static_cast<void>(makeClient().corvelIDsForAssets());
  EXPECT_TRUE(sameLines({unexpectedType("corvelID"), unexpectedType("CorvelID")}, platform.log.lines(0)));
  platform.log.clear();
  put(metadataOf("x", plist::Dictionary{{"CorvelID", 7}, {"DSPersonID", "7"}, {"AltDSID", 7}}));
  static_cast<void>(makeClient().accountsForAssets());
  EXPECT_TRUE(sameLines({unexpectedType("CorvelID"), unexpectedType("DSPersonID"), unexpectedType("AltDSID")},
                        platform.log.lines(0)));
}

TEST_F(HostileStoreMetadata, ARootOfEveryOtherTypeIsNoMetadata) {
  for (const plist::Value& odd : oddValuesAnd({kText, kNumber})) {
    put(odd);
    expectNoAccount();
  }
  EXPECT_TRUE(platform.log.lines(0).empty());
}

TEST_F(HostileStoreMetadata, AnEmptyFileIsNoMetadata) {
  platform.files.put(kPath, "");
  expectNoAccount();
}

TEST_F(HostileStoreMetadata, AFileCutOffAnywhereIsNoMetadata) {
  const plist::Dictionary metadata = metadataOf("x", plist::Dictionary{{"CorvelID", "x"}, {"AltDSID", "000"}});
  for (const Bytes& whole : {binaryForm(metadata), xmlForm(metadata)}) {
    for (std::size_t length = 1; length < whole.size() - 1; length += 7) {
      platform.files.put(kPath, ByteView(whole).first(length));
      EXPECT_EQ(makeClient().corvelIDsForAssets(), (Identifiers{"first", "last"})) << length;
    }
  }
}

TEST_F(HostileStoreMetadata, AFileThatCannotBeReadIsNoMetadata) {
  put(plist::Dictionary{{"corvelId", "x"}});
  platform.files.failures.failAlways(FileOperation::readFile, kPath, {"POSIX", 5, "damaged disk", nullptr});
  expectNoAccount();
}

TEST_F(HostileStoreMetadata, AFolderInTheFilesPlaceIsNoMetadata) {
  platform.files.putFolder(kPath);
  expectNoAccount();
  EXPECT_TRUE(platform.files.hasFolder(kPath));
}

TEST_F(HostileStoreMetadata, ALinkOutOfTheDeviceIsNoMetadata) {
  platform.files.putLink(kPath, "../../../../../../../../etc/passwd");
  expectNoAccount();
}

TEST_F(HostileStoreMetadata, ALinkOutOfTheContainerIsFollowedWithinTheDevice) {
  putPropertyList(platform.files, "/var/mobile/elsewhere.plist", plist::Dictionary{{"corvelId", "x"}});
  platform.files.putLink(kPath, "/var/mobile/elsewhere.plist");
  EXPECT_EQ(makeClient().corvelIDsForAssets(), (Identifiers{"first", "last", "x"}));
}

TEST_F(HostileStoreMetadata, ALinkToItselfIsNoMetadata) {
  platform.files.putLink(kPath, kPath);
  expectNoAccount();
}

TEST_F(HostileStoreMetadata, ReadsFileOfAnySize) {
  put(plist::Dictionary{{"corvelId", "x"}, {"picture", plist::Value::data(Bytes(std::size_t{17} << 20))}});
  AppsClient& client = makeClient();
  EXPECT_EQ(client.corvelIDsForAssets(), (Identifiers{"first", "last", "x"}));
  EXPECT_EQ(client.accountsForAssets(), (ZTAccountInfos{account("first"), account("last"), account("x")}));
}

TEST_F(HostileStoreMetadata, AHundredThousandDictionariesDeepIsNoMetadata) {
  std::string document;
  for (int level = 0; level < 100'000; ++level)
    document += "{a=";
  platform.files.put(kPath, document);
  expectNoAccount();
}

TEST_F(HostileStoreMetadata, TextIsReportedAsItIs) {
  const std::string odd("\x1b[2J\0 \xe2\x80\xae", 9);
  put(metadataOf(plist::Dictionary{{"CorvelID", odd}, {"AltDSID", odd}}));
  AppsClient& client = makeClient();
  EXPECT_TRUE(client.corvelIDsForAssets().contains(odd));
  EXPECT_EQ(*client.accountsForAssets().find(odd), account(odd, std::nullopt, odd));
}

}  // namespace
}  // namespace appsync::test
