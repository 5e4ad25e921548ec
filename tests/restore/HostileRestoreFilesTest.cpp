// Restore files that no sane host writes: each has its outcome, and ends where restore files end.
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "tests/restore/RestoreFixture.h"

namespace appsync::test {
namespace {

class HostileRestoreFile : public RestoreFixture {
 protected:
  /// Runs a restore of this document without coordination.
  bool process(ByteView document) {
    platform.files.put(kRestoreInfo, document);
    return makeClient()._processHarvoRestoreInfo();
  }
  bool processRoot(const plist::Value& root) { return process(ByteView(xmlForm(root))); }
};

TEST_F(HostileRestoreFile, ADocumentThatIsNoneMakesNoPlaceholderAndIsFiledAway) {
  const Bytes binary = binaryForm(plist::Dictionary{{"com.a", restoredApp()}});
  const Bytes xml = xmlForm(plist::Dictionary{{"com.a", restoredApp()}});
  const std::vector<ByteView> documents{ByteView(),
                                        bytesOf("not a property list"),
                                        bytesOf("word"),
                                        bytesOf("bplist00"),
                                        ByteView(binary).first(binary.size() - 1),
                                        ByteView(binary).first(binary.size() / 2),
                                        ByteView(xml).first(xml.size() / 2)};
  for (const ByteView document : documents) {
    SCOPED_TRACE(document.size());
    EXPECT_FALSE(process(document));
    EXPECT_TRUE(platform.registry.identifiers().empty());
    EXPECT_EQ(platform.log.messages().size(), 2U);
    EXPECT_TRUE(platform.log.messages().back().starts_with("failed to parse harvo app restore info. err=PropertyList"));
    expectFiledAway();
    platform.log.clear();
  }
}

TEST_F(HostileRestoreFile, ALastAppThatCannotBeReadKeepsTheOthersFromBeingTakenToo) {
  std::string document(textOf(binaryForm(plist::Dictionary{{"com.a", restoredApp()}, {"com.b", "marked"}})));
  const std::size_t marked = document.find("Vmarked");
  ASSERT_NE(marked, std::string::npos);
  document[marked] = '\x07';
  EXPECT_FALSE(process(bytesOf(document)));
  EXPECT_TRUE(platform.registry.identifiers().empty());
  EXPECT_TRUE(platform.log.messages().back().starts_with("failed to parse harvo app restore info. err=PropertyList"));
  expectFiledAway();
}

TEST_F(HostileRestoreFile, ARootOfAnotherTypeIsAsADocumentThatDoesNotParse) {
  for (const plist::Value& root : {plist::Value(plist::Array{"com.a"}), plist::Value("com.a"), plist::Value(7)}) {
    EXPECT_FALSE(processRoot(root));
    EXPECT_TRUE(said("failed to parse harvo app restore info. err=PropertyList 2 \"The root is not a dictionary\""));
    EXPECT_FALSE(said("Finished waiting for placeholder installs"));
    expectFiledAway();
    platform.log.clear();
  }
}

TEST_F(HostileRestoreFile, AFolderInItsPlaceIsFiledAway) {
  platform.files.putFolder(kRestoreInfo);
  EXPECT_FALSE(makeClient()._processHarvoRestoreInfo());
  EXPECT_TRUE(platform.log.messages().front().starts_with("failed to read harvo app restore info. err="));
  EXPECT_TRUE(platform.files.hasFolder(kFiledRestoreInfo));
}

TEST_F(HostileRestoreFile, AnEntryOfAnotherTypeIsSkipped) {
  const plist::Dictionary apps{
      {"com.a", "text"}, {"com.b", plist::Array{restoredApp()}}, {"com.c", dataOf("x")}, {"com.d", 7}};
  EXPECT_FALSE(processRoot(apps));
  for (const char* identifier : {"com.a", "com.b", "com.c", "com.d"})
    EXPECT_TRUE(said("no harvo restore info for '" + std::string(identifier) + "' - skipping"));
  EXPECT_TRUE(platform.registry.identifiers().empty());
  expectFiledAway();
}

TEST_F(HostileRestoreFile, MetadataThatIsMissingOrNoDataIsIgnored) {
  const plist::Dictionary app = restoredApp();
  EXPECT_FALSE(processRoot(plist::Dictionary{{"com.a", without(app, "HarvoMetadata")},
                                             {"com.b", with(app, "HarvoMetadata", "text")},
                                             {"com.c", with(app, "HarvoMetadata", storeMetadata())}}));
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    EXPECT_TRUE(said("no HarvoMetadata for '" + std::string(identifier) + "' - ignoring"));
  EXPECT_TRUE(platform.transactions.scenarios().empty());
  expectFiledAway();
}

TEST_F(HostileRestoreFile, LicenceAndIconOfAnotherTypeAreAbsent) {
  EXPECT_TRUE(processRoot(
      plist::Dictionary{{"com.a", with(with(restoredApp(), "ApplicationSINF", "text"), "PlaceholderIcon", 7)}}));
  EXPECT_TRUE(complained("no icon data for 'com.a'"));
  EXPECT_TRUE(platform.registry.installs().at(0).options.find("LicenceData")->isNull());
}

TEST_F(HostileRestoreFile, WrongTypesInTheMetadataAreAbsentOnes) {
  const plist::Array wrong{"x"};
  const plist::Dictionary metadata{{"title", wrong},
                                   {"itemName", "Name"},
                                   {"bundleVersion", "1"},
                                   {"UIPeriodixApp", wrong},
                                   {"launchProhibited", wrong}};
  EXPECT_TRUE(processRoot(plist::Dictionary{{"com.a", restoredApp(metadata)}}));
  const auto info = propertyListAt(platform.files, kAppInfo);
  EXPECT_EQ(*info->find("BundleDisplayName"), plist::Value("Name"));
  EXPECT_EQ(*info->find("UIPeriodixApp"), plist::Value(false));
  EXPECT_EQ(*info->find("TSApplicationLaunchProhibited"), plist::Value(false));
  EXPECT_FALSE(processRoot(plist::Dictionary{{"com.b", restoredApp(with(metadata, "bundleVersion", 1))}}));
  EXPECT_EQ(platform.transactions.scenarios().back().description, "Failed to create placeholder info");
}

TEST_F(HostileRestoreFile, AnIdentifierThatLeadsElsewhereIsIgnored) {
  EXPECT_TRUE(processRoot(plist::Dictionary{{"../../var/evil", restoredApp()}, {"com.a", restoredApp()}, {"x/..", 7}}));
  EXPECT_TRUE(said("Ignoring invalid path: ../../var/evil"));
  EXPECT_TRUE(said("Ignoring invalid path: x/.."));
  EXPECT_EQ(platform.registry.identifiers(), (std::vector<std::string>{"com.a"}));
  EXPECT_FALSE(platform.files.has("/var/evil.app"));
  expectFiledAway();
}

TEST_F(HostileRestoreFile, AnIdentifierThatLeadsElsewhereGetsNoCoordinatorEither) {
  platform.coordination.enable();
  EXPECT_FALSE(processRoot(plist::Dictionary{{"x/../../evil", restoredApp()}}));
  EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
}

TEST_F(HostileRestoreFile, TwentyThousandAppsAreAllTaken) {
  constexpr std::size_t kApps = 20'000;
  const plist::Value app = restoredApp();
  plist::Dictionary apps;
  plist::Array demoted;
  for (std::size_t number = 0; number < kApps; ++number) {
    const std::string identifier = "com.example.app" + std::to_string(100'000 + number);
    apps.set(identifier, app);
    demoted.emplace_back(identifier);
  }
  putDemotedApps(demoted, demoted);
  for (const int category : {8, 14})
    platform.log.disable(category, LogLevel::standard);
  EXPECT_TRUE(process(binaryForm(apps)));
  EXPECT_EQ(platform.registry.identifiers().size(), kApps);
  EXPECT_EQ(platform.registry.installs().size(), kApps);
  expectFiledAway();
}

}  // namespace
}  // namespace appsync::test
