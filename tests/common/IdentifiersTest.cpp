// Sets of bundle identifiers, and the check of those from a host.
#include <map>
#include <string>

#include <gtest/gtest.h>

#include "common/Identifiers.h"
#include "kit/fakes/SyncFileBuilder.h"

namespace appsync::test {

namespace {

bool isValid(const plist::Value& value) {
  return isValidBundleIdentifier(&value);
}

}  // namespace

TEST(IdentifiersOf, ReturnsTheKeysOfAMap) {
  const std::map<std::string, int, std::less<>> map{{"com.b", 1}, {"com.a", 2}};
  EXPECT_EQ(identifiersOf(map), (IdentifierSet{"com.a", "com.b"}));
  EXPECT_EQ(identifiersOf(std::map<std::string, int>{}), IdentifierSet{});
}

TEST(IsValidBundleIdentifier, RefusesNull) {
  EXPECT_FALSE(isValidBundleIdentifier(nullptr));
}

TEST(IsValidBundleIdentifier, RefusesNonStrings) {
  EXPECT_FALSE(isValid(plist::Value()));
  EXPECT_FALSE(isValid(7));
  EXPECT_FALSE(isValid(true));
  EXPECT_FALSE(isValid(plist::Value::data(bytesOf("com.a"))));
  EXPECT_FALSE(isValid(plist::Array{"com.a"}));
  EXPECT_FALSE(isValid(plist::Dictionary{{"com.a", "com.a"}}));
}

TEST(IsValidBundleIdentifier, RefusesSlashFollowedByTwoDots) {
  for (const char* text : {"/..", "/../etc", "com.a/..", "com.a/../com.b", "com.a/..b", "//..", "/..."})
    EXPECT_FALSE(isValid(text)) << text;
}

TEST(IsValidBundleIdentifier, AcceptsDotDotWithoutLeadingSlash) {
  for (const char* text : {"..", "com..a", "../com.a", "com.a..", ".. /"})
    EXPECT_TRUE(isValid(text)) << text;
}

TEST(IsValidBundleIdentifier, AcceptsSlashesDotsAndEmptyText) {
  for (const char* text : {"", "/", "/com.a", "com/a", "/.", "/./.", "com.a"})
    EXPECT_TRUE(isValid(text)) << text;
}

}  // namespace appsync::test
