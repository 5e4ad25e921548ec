#include "kit/contracts/ProfileConnectionContract.h"

#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::RestrictionSetting;
using platform::RestrictionValue;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(ProfileConnectionContract);

TEST_P(ProfileConnectionContract, SettingsAreInitiallyUnset) {
  platform::ProfileConnection& connection = subject().connection();
  EXPECT_EQ(connection.effectiveBoolValueForSetting(RestrictionSetting::appInstallationAllowed),
            RestrictionValue::unset);
  EXPECT_EQ(connection.effectiveBoolValueForSetting(RestrictionSetting::appRemovalAllowed), RestrictionValue::unset);
}

TEST_P(ProfileConnectionContract, ReturnsTheCurrentSetting) {
  platform::ProfileConnection& connection = subject().connection();
  for (const RestrictionValue value : {RestrictionValue::no, RestrictionValue::yes, RestrictionValue::unset}) {
    subject().set(RestrictionSetting::appRemovalAllowed, value);
    EXPECT_EQ(connection.effectiveBoolValueForSetting(RestrictionSetting::appRemovalAllowed), value);
  }
}

TEST_P(ProfileConnectionContract, SettingsAreIndependent) {
  platform::ProfileConnection& connection = subject().connection();
  subject().set(RestrictionSetting::appInstallationAllowed, RestrictionValue::no);
  EXPECT_EQ(connection.effectiveBoolValueForSetting(RestrictionSetting::appInstallationAllowed), RestrictionValue::no);
  EXPECT_EQ(connection.effectiveBoolValueForSetting(RestrictionSetting::appRemovalAllowed), RestrictionValue::unset);
}

TEST_P(ProfileConnectionContract, IsThreadSafe) {
  subject().set(RestrictionSetting::appInstallationAllowed, RestrictionValue::no);
  runOnThreads(8, [&](std::size_t) {
    EXPECT_EQ(subject().connection().effectiveBoolValueForSetting(RestrictionSetting::appInstallationAllowed),
              RestrictionValue::no);
  });
}

}  // namespace appsync::test
