// The placeholder of a restored app where installs are not coordinated.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "platform/Keys.h"
#include "tests/restore/RestoreFixture.h"

namespace appsync::test {
namespace {

class RestorePlaceholder : public RestoreFixture {
 protected:
  bool process(const plist::Dictionary& metadata = storeMetadata()) { return process(xmlForm(metadata)); }
  bool process(const Bytes& metadata) {
    return makeTracedClient()._processHarvoRestoreInfoForApp("com.a", metadata, bytesOf("a licence"),
                                                             bytesOf("a picture"));
  }

  [[nodiscard]] std::optional<plist::Value> info() { return propertyListAt(platform.files, kAppInfo); }

  static ScenarioEntry entry(Success success, const char* text) {
    return {"Harvo App Restore", success, "com.a", text, 0};
  }
};

using Scenarios = std::vector<ScenarioEntry>;

TEST_F(RestorePlaceholder, ItsInfoDictionaryHasSevenEntries) {
  EXPECT_TRUE(process());
  EXPECT_EQ(info(), plist::Value(plist::Dictionary{{"BundleIdentifier", "com.a"},
                                                   {"BundleVersion", "2.0"},
                                                   {"BundleExecutable", "An App"},
                                                   {"BundleDisplayName", "An App"},
                                                   {"BundleIconFile", "Icon.png"},
                                                   {"UIPeriodixApp", false},
                                                   {"TSApplicationLaunchProhibited", false}}));
  EXPECT_EQ(platform.files.owners(kAppFolder), (platform::OwnerAttributes{"mobile", "mobile"}));
  EXPECT_EQ(platform.files.owners(kAppIcon), (platform::OwnerAttributes{"mobile", "mobile"}));
  EXPECT_EQ(platform.files.text(kAppIcon), "a picture");
}

TEST_F(RestorePlaceholder, ItsFlagsAreThoseOfTheMetadata) {
  EXPECT_TRUE(process(with(with(storeMetadata(), "UIPeriodixApp", true), "TSApplicationLaunchProhibited", true)));
  EXPECT_EQ(*info()->find("UIPeriodixApp"), plist::Value(true));
  EXPECT_EQ(*info()->find("TSApplicationLaunchProhibited"), plist::Value(true));
  EXPECT_TRUE(
      said("Installed Placeholder app from path " + std::string(kAppFolder) + ": An App [com.a 2.0] [isPeriodix: 1]"));
}

TEST_F(RestorePlaceholder, TheInstallerGetsMetadataAndLicenceAsTheyWereRead) {
  EXPECT_TRUE(process());
  const auto installs = platform.registry.installs();
  ASSERT_EQ(installs.size(), 1U);
  EXPECT_EQ(installs[0].location, (platform::FileLocation{std::string(kAppFolder), true}));
  EXPECT_EQ(installs[0].options,
            (plist::Dictionary{{platform::PackageTypeKey, platform::PackageTypePlaceholder},
                               {platform::BundleIdentifierKey, "com.a"},
                               {"TSInstallType", 2},
                               {platform::kStoreMetadataKey, plist::Value(xmlForm(storeMetadata()))},
                               {platform::kLicenceDataKey, dataOf("a licence")}}));
  EXPECT_EQ(platform.transactions.scenarios(), (Scenarios{entry(Success::yes, "Installed placeholder")}));
}

TEST_F(RestorePlaceholder, AnAppWithoutALicenceIsInstalledWithAnExplicitNull) {
  AppsClient& client = makeClient();
  EXPECT_TRUE(client._processHarvoRestoreInfoForApp("com.a", xmlForm(storeMetadata()), std::nullopt, std::nullopt));
  const auto installs = platform.registry.installs();
  ASSERT_EQ(installs.size(), 1U);
  EXPECT_EQ(installs[0].options.size(), 5U);
  ASSERT_TRUE(installs[0].options.contains(platform::kLicenceDataKey));
  EXPECT_TRUE(installs[0].options.find(platform::kLicenceDataKey)->isNull());
}

TEST_F(RestorePlaceholder, AnAppWithoutAnIconGetsItsPlaceholderAllTheSame) {
  AppsClient& client = makeClient();
  EXPECT_TRUE(client._processHarvoRestoreInfoForApp("com.a", xmlForm(storeMetadata()), std::nullopt, std::nullopt));
  EXPECT_TRUE(complained("no icon data for 'com.a'"));
  EXPECT_FALSE(platform.files.has(kAppIcon));
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
}

TEST_F(RestorePlaceholder, AnIconThatCannotBeWrittenIsMissedByNobody) {
  platform.files.failures.failAlways(FileOperation::createFile, kAppIcon, error);
  EXPECT_TRUE(process());
  EXPECT_EQ(info()->find("BundleIconFile")->string(), "Icon.png");
}

TEST_F(RestorePlaceholder, WithoutATitleItGoesByTheItemsName) {
  EXPECT_TRUE(process(with(without(storeMetadata(), "title"), "itemName", "Another Name")));
  EXPECT_EQ(*info()->find("BundleDisplayName"), plist::Value("Another Name"));
}

TEST_F(RestorePlaceholder, UnreadableMetadataCountsAsDealtWith) {
  const Bytes whole = binaryForm(storeMetadata());
  const Bytes broken(whole.begin(), whole.begin() + 20);
  EXPECT_TRUE(process(broken));
  const auto failure = plist::read(ByteView(broken));
  ASSERT_FALSE(failure);
  EXPECT_TRUE(sameLines({logged("processing app restore info for 'com.a'"),
                         logged("failed to parse harvo metadata for 'com.a'. err=" + description(failure.error())),
                         called("transactionLog.logScenario Harvo App Restore com.a n Failed to parse harvo metadata")},
                        platform.log.lines()));
}

TEST_F(RestorePlaceholder, MetadataThatIsNoDictionaryIsUnreadable) {
  EXPECT_TRUE(process(xmlForm(plist::Array{"title", "An App"})));
  EXPECT_TRUE(said("failed to parse harvo metadata for 'com.a'. err=PropertyList 2 \"The root is not a dictionary\""));
  EXPECT_EQ(platform.transactions.scenarios(), (Scenarios{entry(Success::no, "Failed to parse harvo metadata")}));
}

TEST_F(RestorePlaceholder, WithoutAVersionTheInfoCannotBeWritten) {
  const plist::Dictionary metadata = without(storeMetadata(), "bundleVersion");
  EXPECT_FALSE(process(metadata));
  const std::string folder(kAppFolder);
  const std::string written =
      "{BundleDisplayName = \"An App\"; BundleExecutable = \"An App\"; BundleIconFile = Icon.png; "
      "BundleIdentifier = com.a; BundleVersion = (null); TSApplicationLaunchProhibited = 0; UIPeriodixApp = 0;}";
  EXPECT_TRUE(
      sameLines({logged("processing app restore info for 'com.a'"), called("fileSystem.temporaryDirectory"),
                 called("fileSystem.createDirectory " + folder),
                 logged("Created app directory for 'com.a' at " + folder + " with err=(null)"),
                 called("fileSystem.createFile " + folder + "/Icon.png"),
                 called("fileSystem.attributesOfItem " + folder + "/Icon.png"),
                 logged("icon data for 'com.a' was writen to " + folder + "/Icon.png with status:1 fileSize:9"),
                 logged("creating placeholder for 'com.a'. info.plist=" + written),
                 logged("failed to create placeholder info at " + folder + "/Info.plist with info " + written),
                 called("transactionLog.logScenario Harvo App Restore com.a n Failed to create placeholder info"),
                 logged("failed to process app restore info for 'com.a'. harvoMetadataDictionary=" +
                        description(plist::Value(metadata)))},
                platform.log.lines()));
  EXPECT_TRUE(platform.files.has(kAppIcon));
  EXPECT_FALSE(platform.files.has(kAppInfo));
}

TEST_F(RestorePlaceholder, WithoutANameTheInfoCannotBeWritten) {
  EXPECT_FALSE(process(without(storeMetadata(), "title")));
  EXPECT_EQ(platform.transactions.scenarios(), (Scenarios{entry(Success::no, "Failed to create placeholder info")}));
  EXPECT_TRUE(platform.registry.installs().empty());
}

TEST_F(RestorePlaceholder, AFolderThatCannotBeMadeIsRecordedByBothWhoWantedIt) {
  platform.files.failures.failAlways(FileOperation::createDirectory, kAppFolder, error);
  EXPECT_FALSE(process());
  EXPECT_TRUE(said("failed to create app directory for 'com.a'. err=(null)"));
  EXPECT_TRUE(said("failed to process app restore info for 'com.a'. harvoMetadataDictionary=" +
                   description(plist::Value(storeMetadata()))));
  EXPECT_EQ(platform.transactions.scenarios(), (Scenarios{entry(Success::no, "Failed to create app directory"),
                                                          entry(Success::no, "Failed to create app directory")}));
  EXPECT_EQ(platform.journal.count("fileSystem.createFile"), 0U);
}

TEST_F(RestorePlaceholder, AnInfoThatCannotBeStoredIsRecorded) {
  platform.files.failures.failAlways(FileOperation::writeFileAtomically, kAppInfo, error);
  EXPECT_FALSE(process());
  EXPECT_EQ(platform.transactions.scenarios(), (Scenarios{entry(Success::no, "Failed to create placeholder info")}));
  EXPECT_TRUE(platform.files.has(kAppIcon));
}

TEST_F(RestorePlaceholder, AFailedInstallIsAnErrorAndLeavesTheFolder) {
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", error);
  EXPECT_FALSE(process());
  EXPECT_TRUE(complained("Placeholder app install failed from path " + std::string(kAppFolder) +
                         ": An App [com.a 2.0] [isPeriodix: 0]"));
  EXPECT_TRUE(said("failed to process app restore info for 'com.a'. harvoMetadataDictionary=" +
                   description(plist::Value(storeMetadata()))));
  EXPECT_EQ(platform.transactions.scenarios(), (Scenarios{entry(Success::no, "Failed to install placeholder")}));
  EXPECT_TRUE(platform.files.has(kAppInfo));
}

}  // namespace
}  // namespace appsync::test
