// The info dictionary of a placeholder bundle.
#include <gtest/gtest.h>

#include "transfer/PlaceholderInfo.h"

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
