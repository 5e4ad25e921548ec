// Placeholder apps laid out on disk and handed to the registry.
#include <cerrno>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using platform::OwnerAttributes;
using platform::ZTAsset;
using Strings = std::vector<std::string>;

constexpr std::string_view kFolder = "/tmp/com.corvel.zeph.Apps/com.a.app";
constexpr std::string_view kStagedInfo = "/var/mobile/Library/ApplicationSync/HarvoStuff/com.a/Info.plist";
const OwnerAttributes kMobile{"mobile", "mobile"};
const Error kDenied{"POSIX", 13, "Permission denied", nullptr};

class PlaceholderBundle : public ClientFixture {
 protected:
  void SetUp() override {
    platform.files.put("/icons/com.a.png", "a picture");
    asset_.setIcon(platform::FileLocation::file("/icons/com.a.png"));
    asset_.setInfoPlist(std::string(kStagedInfo));
    asset_.setVariantOptions({{"Version", "3.1"}, {"AssetParts", 1}});
  }

  AppsClient& create(const ZTAsset& asset) {
    AppsClient& client = makeClient();
    platform.log.clear();
    client._createPlaceHolderApplication(asset);
    return client;
  }

  [[nodiscard]] plist::Value writtenInfo() {
    return propertyListAt(platform.files, std::string(kFolder) + "/Info.plist").value_or(plist::Value());
  }

  ZTAsset asset_{"com.a", "Application", "An App"};
};

TEST_F(PlaceholderBundle, ThePathNamesTheAppInTheTemporaryFolderAndNothingIsMade) {
  EXPECT_EQ(makeClient().placeholderAppPathForBundleIdentifier("com.a"), kFolder);
  EXPECT_FALSE(platform.files.has("/tmp/com.corvel.zeph.Apps"));
}

TEST_F(PlaceholderBundle, CreatingTheFolderMakesItsParentsAndGivesItToMobile) {
  EXPECT_TRUE(makeClient().createPlaceHolderPath(kFolder, "com.a", kMobile));
  EXPECT_EQ(platform.files.owners(kFolder), kMobile);
  EXPECT_TRUE(platform.log.contains(
      logged("Created app directory for 'com.a' at " + std::string(kFolder) + " with err=(null)")));
  EXPECT_TRUE(platform.transactions.scenarios().empty());
}

TEST_F(PlaceholderBundle, AFolderThatCannotBeMadeIsRecordedAsARestoresFailure) {
  platform.files.failures.failNext(FileOperation::createDirectory, kFolder, kDenied);
  EXPECT_FALSE(makeClient().createPlaceHolderPath(kFolder, "com.a", kMobile));
  EXPECT_EQ(platform.transactions.scenarios(),
            (std::vector{ScenarioEntry{"Harvo App Restore", Success::no, "com.a", "Failed to create app directory"}}));
  EXPECT_TRUE(platform.log.contains(
      logged("Created app directory for 'com.a' at " + std::string(kFolder) + " with err=" + description(kDenied))));
}

TEST_F(PlaceholderBundle, IconDataIsWrittenWithItsOwnersAndItsSizeReturned) {
  platform.files.put("/tmp/Icon.png", "what was there before");
  std::uint64_t size = 0;
  EXPECT_TRUE(makeClient().writeIconData(bytesOf("picture"), "/tmp/Icon.png", &size, "com.a", kMobile));
  EXPECT_EQ(size, 7U);
  EXPECT_EQ(platform.files.text("/tmp/Icon.png"), "picture");
  EXPECT_EQ(platform.files.owners("/tmp/Icon.png"), kMobile);
  EXPECT_TRUE(
      platform.log.contains(logged("icon data for 'com.a' was writen to /tmp/Icon.png with status:1 fileSize:7")));
}

TEST_F(PlaceholderBundle, IconDataIsWrittenWithoutASizeToReturn) {
  EXPECT_TRUE(makeClient().writeIconData(bytesOf("picture"), "/tmp/Icon.png", nullptr, "com.a", kMobile));
  EXPECT_TRUE(platform.files.has("/tmp/Icon.png"));
}

TEST_F(PlaceholderBundle, WithoutIconDataNothingIsWritten) {
  std::uint64_t size = 99;
  EXPECT_FALSE(makeClient().writeIconData(std::nullopt, "/tmp/Icon.png", &size, "com.a", kMobile));
  EXPECT_TRUE(platform.log.contains(loggedError("no icon data for 'com.a'")));
  EXPECT_FALSE(platform.files.has("/tmp/Icon.png"));
  EXPECT_EQ(size, 99U);
}

TEST_F(PlaceholderBundle, IconDataThatCannotBeWrittenLeavesTheSizeAlone) {
  std::uint64_t size = 99;
  platform.files.failures.failNext(FileOperation::createFile, "/tmp/Icon.png", kDenied);
  EXPECT_FALSE(makeClient().writeIconData(bytesOf("picture"), "/tmp/Icon.png", &size, "com.a", kMobile));
  EXPECT_EQ(size, 99U);
  EXPECT_TRUE(
      platform.log.contains(logged("icon data for 'com.a' was writen to /tmp/Icon.png with status:0 fileSize:0")));
}

TEST_F(PlaceholderBundle, ASizeThatCannotBeReadIsZeroAndTheWriteStillASuccess) {
  std::uint64_t size = 99;
  platform.files.failures.failNext(FileOperation::attributesOfItem, "/tmp/Icon.png", kDenied);
  EXPECT_TRUE(makeClient().writeIconData(bytesOf("picture"), "/tmp/Icon.png", &size, "com.a", kMobile));
  EXPECT_EQ(size, 99U);
  EXPECT_TRUE(
      platform.log.contains(logged("icon data for 'com.a' was writen to /tmp/Icon.png with status:1 fileSize:0")));
}

TEST_F(PlaceholderBundle, APlaceholderIsBuiltInstalledAndRecorded) {
  putPropertyList(platform.files, kStagedInfo,
                  plist::Dictionary{{"UIPeriodixApp", true}, {"TSApplicationLaunchProhibited", "YES"}});
  create(asset_);

  const plist::Value info = plist::Dictionary{{"BundleIdentifier", "com.a"},          {"BundleVersion", "3.1"},
                                              {"BundleExecutable", "An App"},         {"BundleDisplayName", "An App"},
                                              {"BundleIconFile", "Icon.png"},         {"UIPeriodixApp", true},
                                              {"TSApplicationLaunchProhibited", true}};
  const std::string folder(kFolder);
  EXPECT_EQ(writtenInfo(), info);
  EXPECT_TRUE(platform.files.text(folder + "/Info.plist")->starts_with("<?xml"));
  EXPECT_EQ(platform.files.text(folder + "/Icon.png"), "a picture");
  EXPECT_TRUE(
      sameLines({logged("plist " + std::string(kStagedInfo)),
                 logged("Created app directory for 'com.a' at " + folder + " with err=(null)"),
                 logged("creating placeholder for 'com.a'. info.plist=" + description(info)),
                 logged("Installed Placeholder app from path " + folder + ": An App [com.a 3.1] [isPeriodix: 1]")},
                platform.log.lines()))
      << description(plist::Value(true));
  ASSERT_EQ(platform.registry.installs().size(), 1U);
  EXPECT_EQ(platform.registry.installs()[0].location, (platform::FileLocation{folder, true}));
  EXPECT_EQ(platform.registry.installs()[0].options,
            (plist::Dictionary{{"PackageType", "Placeholder"}, {"BundleIdentifier", "com.a"}, {"TSInstallType", 4}}));
  EXPECT_EQ(platform.transactions.scenarios(),
            (std::vector{ScenarioEntry{"Install placeholder", Success::yes, "com.a", "Installed placeholder"}}));
  EXPECT_TRUE(platform.files.hasFolder(folder));
  EXPECT_EQ(platform.files.owners(folder), (platform::OwnerAttributes{"mobile", "mobile"}));
}

TEST_F(PlaceholderBundle, AFailedInstallIsLoggedAndRecordedAndLeavesTheFolder) {
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", installerError("no"));
  create(asset_);
  EXPECT_TRUE(platform.log.contains(loggedError("Placeholder app install failed from path " + std::string(kFolder) +
                                                ": An App [com.a 3.1] [isPeriodix: 0]")));
  EXPECT_EQ(platform.transactions.scenarios(),
            (std::vector{ScenarioEntry{"Install placeholder", Success::no, "com.a", "Failed to install placeholder"}}));
  EXPECT_TRUE(platform.files.hasFolder(kFolder));
}

TEST_F(PlaceholderBundle, AHostInfoDictionaryWithoutThePeriodicalFlagGivesFalse) {
  putPropertyList(platform.files, kStagedInfo, plist::Dictionary{{"Other", 1}});
  create(asset_);
  EXPECT_EQ(*writtenInfo().find("UIPeriodixApp"), plist::Value(false));
  EXPECT_EQ(*writtenInfo().find("TSApplicationLaunchProhibited"), plist::Value(false));
}

TEST_F(PlaceholderBundle, AHostInfoFileThatIsNoDictionaryCountsAsNone) {
  putPropertyList(platform.files, kStagedInfo, plist::Array{1, 2});
  create(asset_);
  EXPECT_EQ(*writtenInfo().find("UIPeriodixApp"), plist::Value(false));
  EXPECT_EQ(writtenInfo().dictionary()->size(), 7U);
}

TEST_F(PlaceholderBundle, AnAssetWithAnEmptyNameMakesNoFolderAndSaysNoMore) {
  ZTAsset nameless("com.a", "Application", "");
  nameless.setInfoPlist("/info");
  create(nameless);
  EXPECT_TRUE(sameLines({logged("plist /info")}, platform.log.lines()));
  EXPECT_TRUE(platform.journal.lines({"fileSystem.createDirectory"}).empty());
  EXPECT_TRUE(platform.transactions.scenarios().empty());
}

TEST_F(PlaceholderBundle, AnAssetWithoutANameOrIdentifierMakesNoFolder) {
  create(ZTAsset("com.a", "Application", std::nullopt));
  create(ZTAsset("", "Application", "An App"));
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_TRUE(platform.journal.lines({"fileSystem.createDirectory"}).empty());
}

TEST_F(PlaceholderBundle, AFolderThatCannotBeMadeEndsItThere) {
  platform.files.failures.failNext(FileOperation::createDirectory, kFolder, kDenied);
  create(asset_);
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_EQ(platform.log.messages().size(), 2U);
  EXPECT_EQ(platform.transactions.scenarios().size(), 1U);
}

TEST_F(PlaceholderBundle, AnIconThatCannotBeCopiedStillYieldsAPlaceholderThatNamesIt) {
  platform.files.erase("/icons/com.a.png");
  create(asset_);
  EXPECT_EQ(*writtenInfo().find("BundleIconFile"), plist::Value("Icon.png"));
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
  const auto messages = platform.log.messages();
  ASSERT_GT(messages.size(), 2U);
  EXPECT_TRUE(messages[2].starts_with("Copying icon from /icons/com.a.png to " + std::string(kFolder) +
                                      "/Icon.png failed: POSIX 2"))
      << messages[2];
}

TEST_F(PlaceholderBundle, AnIconThatAnEarlierPlaceholderLeftIsReplaced) {
  create(asset_);
  platform.files.put("/icons/com.a.png", "the icon of a newer version");
  create(asset_);
  EXPECT_EQ(platform.files.text(std::string(kFolder) + "/Icon.png"), "the icon of a newer version");
  for (const LogLine& line : platform.log.lines())
    EXPECT_EQ(line.level, LogLevel::standard) << line.text;
}

TEST_F(PlaceholderBundle, CopiesAFirstIconWithoutARemoval) {
  create(asset_);
  EXPECT_EQ(platform.journal.lines({"fileSystem.copyItem", "fileSystem.removeItem"}),
            Strings{"fileSystem.copyItem /icons/com.a.png " + std::string(kFolder) + "/Icon.png"});
}

TEST_F(PlaceholderBundle, MissingSourceKeepsTheEarlierIcon) {
  create(asset_);
  platform.files.erase("/icons/com.a.png");
  create(asset_);
  EXPECT_EQ(platform.files.text(std::string(kFolder) + "/Icon.png"), "a picture");
  // A file system may look at the destination first.
  platform.files.failures.failNext(FileOperation::copyItem, "/icons/com.a.png", Error::fromErrno(EEXIST));
  create(asset_);
  EXPECT_EQ(platform.files.text(std::string(kFolder) + "/Icon.png"), "a picture");
}

TEST_F(PlaceholderBundle, FailedCopyKeepsTheEarlierIcon) {
  create(asset_);
  platform.files.failures.failNext(FileOperation::copyItem, "/icons/com.a.png", kDenied);
  create(asset_);
  EXPECT_EQ(platform.files.text(std::string(kFolder) + "/Icon.png"), "a picture");
}

TEST_F(PlaceholderBundle, AnAssetWithoutAnIconCopiesNone) {
  asset_.setIcon(std::nullopt);
  create(asset_);
  EXPECT_TRUE(platform.journal.lines({"fileSystem.copyItem"}).empty());
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
}

TEST_F(PlaceholderBundle, AnInfoFileThatCannotBeWrittenEndsItSilently) {
  platform.files.failures.failNext(FileOperation::writeFileAtomically, std::string(kFolder) + "/Info.plist", kDenied);
  create(asset_);
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_EQ(platform.log.messages().size(), 2U);
  EXPECT_TRUE(platform.transactions.scenarios().empty());
}

TEST_F(PlaceholderBundle, AnAssetWithoutAVersionHasNoneInItsInfo) {
  asset_.setVariantOptions({});
  create(asset_);
  EXPECT_EQ(writtenInfo().find("BundleVersion"), nullptr);
  EXPECT_TRUE(platform.log.contains(logged("Installed Placeholder app from path " + std::string(kFolder) +
                                           ": An App [com.a (null)] [isPeriodix: 0]")));
}

}  // namespace
}  // namespace appsync::test
