// When the dataclass is disabled altogether.
#include <optional>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using platform::RestrictionSetting;
using platform::RestrictionValue;
using Names = std::optional<std::set<std::string>>;

class DisabledAssetTypes : public ClientFixture {
 protected:
  Names ask(RestrictionValue installation, RestrictionValue removal) {
    platform.restrictions.set(RestrictionSetting::appInstallationAllowed, installation);
    platform.restrictions.set(RestrictionSetting::appRemovalAllowed, removal);
    return makeClient().disabledAssetTypes();
  }
};

TEST_F(DisabledAssetTypes, EitherPermissionAloneKeepsApplicationsEnabled) {
  EXPECT_EQ(ask(RestrictionValue::no, RestrictionValue::yes), std::nullopt);
  EXPECT_EQ(ask(RestrictionValue::yes, RestrictionValue::no), std::nullopt);
  EXPECT_EQ(ask(RestrictionValue::yes, RestrictionValue::yes), std::nullopt);
}

TEST_F(DisabledAssetTypes, AnUnsetRestrictionIsAPermission) {
  EXPECT_EQ(ask(RestrictionValue::no, RestrictionValue::unset), std::nullopt);
  EXPECT_EQ(ask(RestrictionValue::unset, RestrictionValue::no), std::nullopt);
}

TEST_F(DisabledAssetTypes, WithBothForbiddenApplicationsAreDisabled) {
  EXPECT_EQ(ask(RestrictionValue::no, RestrictionValue::no), (Names{{"Application"}}));
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(DisabledAssetTypes, RemovalIsAskedForOnlyWhereInstallationIsForbidden) {
  EXPECT_EQ(ask(RestrictionValue::yes, RestrictionValue::no), std::nullopt);
  EXPECT_EQ(platform.journal.lines().size(), 1U);
}

}  // namespace
}  // namespace appsync::test
