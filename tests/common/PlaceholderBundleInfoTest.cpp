// The info dictionary of a placeholder bundle.
#include <gtest/gtest.h>

#include "common/PlaceholderBundle.h"

namespace appsync::test {
namespace {

TEST(PlaceholderInfo, HasSevenEntries) {
  const plist::Value version = "3.1";
  const PlaceholderInfo info{.bundleIdentifier = "com.a",
                             .version = &version,
                             .displayName = "An App",
                             .isPeriodical = true,
                             .isLaunchProhibited = true};
  EXPECT_EQ(info.dictionary(), (plist::Dictionary{{"BundleIdentifier", "com.a"},
                                                  {"BundleVersion", "3.1"},
                                                  {"BundleExecutable", "An App"},
                                                  {"BundleDisplayName", "An App"},
                                                  {"BundleIconFile", "Icon.png"},
                                                  {"UIPeriodixApp", true},
                                                  {"TSApplicationLaunchProhibited", true}}));
}

TEST(PlaceholderInfo, AFlagThatNobodyGaveIsFalse) {
  const plist::Dictionary dictionary = PlaceholderInfo{.bundleIdentifier = "com.a", .displayName = "A"}.dictionary();
  EXPECT_EQ(*dictionary.find("UIPeriodixApp"), plist::Value(false));
  EXPECT_EQ(*dictionary.find("TSApplicationLaunchProhibited"), plist::Value(false));
}

TEST(PlaceholderInfo, WithoutAVersionThereIsNoEntryForIt) {
  const plist::Dictionary dictionary = PlaceholderInfo{.bundleIdentifier = "com.a", .displayName = "A"}.dictionary();
  EXPECT_FALSE(dictionary.contains("BundleVersion"));
  EXPECT_EQ(dictionary.size(), 6U);
}

TEST(PlaceholderInfo, AMissingNameAndAnExplicitNullMakeADictionaryThatCannotBeWritten) {
  const plist::Value none;
  const plist::Dictionary unnamed = PlaceholderInfo{.bundleIdentifier = "com.a"}.dictionary();
  EXPECT_TRUE(unnamed.find("BundleDisplayName")->isNull());
  EXPECT_TRUE(unnamed.find("BundleExecutable")->isNull());
  EXPECT_FALSE(plist::writeXML(unnamed));
  const plist::Dictionary unversioned =
      PlaceholderInfo{.bundleIdentifier = "com.a", .version = &none, .displayName = "A"}.dictionary();
  EXPECT_EQ(unversioned.size(), 7U);
  EXPECT_FALSE(plist::writeXML(unversioned));
}

TEST(PlaceholderInfo, TheInstallerIsToldWhatItIs) {
  EXPECT_EQ(PlaceholderInfo{.bundleIdentifier = "com.a"}.installOptions(platform::TSInstallType::Restore),
            (plist::Dictionary{{"PackageType", "Placeholder"}, {"BundleIdentifier", "com.a"}, {"TSInstallType", 2}}));
}

TEST(PlaceholderInfo, AVersionAndAPeriodicalFlagOfAnyTypeAreHandedOnAsTheyAre) {
  const plist::Value version = 7;
  const plist::Dictionary dictionary =
      PlaceholderInfo{.bundleIdentifier = "com.a", .version = &version, .displayName = "A", .isPeriodical = 1}
          .dictionary();
  EXPECT_EQ(*dictionary.find("BundleVersion"), plist::Value(7));
  EXPECT_EQ(*dictionary.find("UIPeriodixApp"), plist::Value(1));
}

}  // namespace
}  // namespace appsync::test
