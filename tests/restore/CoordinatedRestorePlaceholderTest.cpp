// The placeholder of a restored app as the install-coordination service gets it.
#include <string>

#include <gtest/gtest.h>

#include "tests/restore/RestoreFixture.h"

namespace appsync::test {
namespace {

class CoordinatedRestorePlaceholder : public CoordinatedRestoreFixture {
 protected:
  /// What is made of that metadata; nobody's in the end.
  FakePlaceholder build(const plist::Dictionary& dictionary = storeMetadata(),
                        DemotionStatus status = DemotionStatus::notDemoted) {
    const auto placeholder =
        makeTracedClient()._placeHolderForBundleIdentifierWithHarvoMetadata("com.a", dictionary, sinf, icon, status);
    EXPECT_NE(placeholder, nullptr);
    return platform.coordination.placeholder("com.a").value();
  }
};

TEST_F(CoordinatedRestorePlaceholder, WithoutTitleAndItemNameItGoesByItsIdentifier) {
  EXPECT_EQ(build(without(storeMetadata(), "title")).bundleName, "com.a");
}

TEST_F(CoordinatedRestorePlaceholder, WithoutATitleItGoesByTheItemsName) {
  EXPECT_EQ(build({{"itemName", "Another Name"}}).bundleName, "Another Name");
}

TEST_F(CoordinatedRestorePlaceholder, WithoutAVersionItHasNone) {
  const FakePlaceholder placeholder = build(without(storeMetadata(), "bundleVersion"));
  EXPECT_EQ(placeholder.attributes->bundleVersion(), std::nullopt);
  EXPECT_FALSE(placeholder.attributes->launchProhibited());
  EXPECT_EQ(placeholder.attributes->infoDictionary(), plist::Dictionary());
}

TEST_F(CoordinatedRestorePlaceholder, TheLaunchFlagIsReadUnderEitherKey) {
  EXPECT_TRUE(build({{"launchProhibited", true}}).attributes->launchProhibited());
}

TEST_F(CoordinatedRestorePlaceholder, AnAbsentOrEmptyIconMakesNoIconPromise) {
  for (const std::optional<ByteView>& none : {std::optional<ByteView>(), std::optional<ByteView>(ByteView())}) {
    icon = none;
    const FakePlaceholder placeholder = build();
    EXPECT_FALSE(placeholder.icon);
    EXPECT_TRUE(placeholder.isConfigured);
    EXPECT_EQ(complained("no icon data for 'com.a'"), !none);
  }
}

TEST_F(CoordinatedRestorePlaceholder, AnIconThatCannotBeWrittenIsAsNone) {
  platform.files.failures.failAlways(FileOperation::createFile, kAppIcon, error);
  EXPECT_FALSE(build().icon);
}

TEST_F(CoordinatedRestorePlaceholder, WithoutALicenceThereIsNoLicenceStepAndNoWordOfIt) {
  sinf = std::nullopt;
  EXPECT_FALSE(build().sinfData);
  EXPECT_EQ(platform.journal.count("placeholder.setSinfData"), 0U);
  for (const std::string& message : platform.log.messages())
    EXPECT_EQ(message.find("SINF"), std::string::npos) << message;
}

TEST_F(CoordinatedRestorePlaceholder, AFolderThatCannotBeMadeLeavesNoPlaceholder) {
  platform.files.failures.failAlways(FileOperation::createDirectory, kAppFolder, error);
  AppsClient& client = makeTracedClient();
  EXPECT_EQ(client._placeHolderForBundleIdentifierWithHarvoMetadata("com.a", storeMetadata(), sinf, icon,
                                                                    DemotionStatus::notDemoted),
            nullptr);
  EXPECT_TRUE(platform.coordination.placeholders().empty());
  EXPECT_EQ(platform.journal.count("fileSystem.createFile"), 0U);
}

TEST_F(CoordinatedRestorePlaceholder, FolderAndIconStayWhateverHappensLater) {
  platform.coordination.failures.failNext("coordinator.setPlaceholderPromise", "com.a", error);
  EXPECT_FALSE(prepare());
  EXPECT_EQ(platform.files.text(kAppIcon), "a picture");
}

}  // namespace
}  // namespace appsync::test
