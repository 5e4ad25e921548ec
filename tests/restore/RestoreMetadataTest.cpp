// What a restored app's store metadata says of its placeholder.
#include <gtest/gtest.h>

#include "restore/RestoreMetadata.h"

namespace appsync::test {
namespace {

std::optional<std::string> nameIn(const plist::Dictionary& metadata) {
  return RestoreMetadata(metadata).displayName();
}

bool isProhibitedIn(const plist::Dictionary& metadata) {
  return RestoreMetadata(metadata).isLaunchProhibited();
}

TEST(RestoreMetadata, TheTitleComesBeforeTheItemsName) {
  EXPECT_EQ(nameIn({{"title", "T"}, {"itemName", "I"}}), "T");
  EXPECT_EQ(nameIn({{"itemName", "I"}}), "I");
  EXPECT_EQ(nameIn({{"title", ""}, {"itemName", "I"}}), "");
  EXPECT_EQ(nameIn({}), std::nullopt);
}

TEST(RestoreMetadata, ATextOfAnotherTypeIsAbsent) {
  EXPECT_EQ(nameIn({{"title", 7}, {"itemName", "I"}}), "I");
  EXPECT_EQ(nameIn({{"itemName", plist::Array{}}}), std::nullopt);
  const plist::Dictionary metadata{{"bundleVersion", 2.0}};
  EXPECT_EQ(RestoreMetadata(metadata).bundleVersion(), nullptr);
}

TEST(RestoreMetadata, TheVersionIsHandedOn) {
  const plist::Dictionary metadata{{"bundleVersion", "2.0"}};
  EXPECT_EQ(*RestoreMetadata(metadata).bundleVersion(), plist::Value("2.0"));
}

TEST(RestoreMetadata, TheFirstLaunchFlagThatIsThereCounts) {
  EXPECT_TRUE(isProhibitedIn({{"TSApplicationLaunchProhibited", true}}));
  EXPECT_TRUE(isProhibitedIn({{"launchProhibited", 1}}));
  EXPECT_FALSE(isProhibitedIn({{"TSApplicationLaunchProhibited", false}, {"launchProhibited", true}}));
  EXPECT_FALSE(isProhibitedIn({{"TSApplicationLaunchProhibited", plist::Array{}}, {"launchProhibited", true}}));
  EXPECT_FALSE(isProhibitedIn({}));
}

TEST(RestoreMetadata, APeriodicalIsOneOnlyWhenItSaysSo) {
  const plist::Dictionary yes{{"UIPeriodixApp", "yes"}};
  const plist::Dictionary no{{"UIPeriodixApp", plist::Dictionary{{"a", true}}}};
  EXPECT_TRUE(RestoreMetadata(yes).isPeriodical());
  EXPECT_FALSE(RestoreMetadata(no).isPeriodical());
  const plist::Dictionary empty;
  EXPECT_FALSE(RestoreMetadata(empty).isPeriodical());
}

}  // namespace
}  // namespace appsync::test
