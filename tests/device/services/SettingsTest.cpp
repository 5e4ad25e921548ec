#include <filesystem>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "device/services/Restrictions.h"
#include "device/services/Settings.h"
#include "tests/support/ServiceDatabase.h"

namespace appsync::test {
namespace {

using Lines = std::vector<std::string>;
using device::AssertionAnswer;
using device::Settings;
using device::SettingsFailure;
using platform::RestrictionSetting;
using platform::RestrictionValue;

Error refusal(SettingsFailure failure, std::string text) {
  return {std::string(device::kSettingsDomain), static_cast<long>(failure), std::move(text), nullptr};
}

class SettingsTest : public testing::Test {
 protected:
  /// Returns the stored rows: "key value", or "key app value" for assertions.
  Lines rows() {
    device::Database::Session session(database);
    device::Statement table =
        session.prepare("select trim(key || ' ' || item) || ' ' || value from settings order by key, item");
    Lines lines;
    while (table.next())
      lines.emplace_back(table.text(0));
    EXPECT_TRUE(table.status());
    return lines;
  }
  Error refusalOf(std::string_view assignment) {
    const Status status = settings.assign(assignment);
    EXPECT_FALSE(status);
    return status.ok() ? Error{} : status.error();
  }

  ServiceDatabase<Settings> database;
  Settings settings{database};
};

TEST_F(SettingsTest, IsUnsetInitially) {
  EXPECT_EQ(rows(), Lines{});
  EXPECT_EQ(settings.restriction(RestrictionSetting::appInstallationAllowed), RestrictionValue::unset);
  EXPECT_EQ(settings.restriction(RestrictionSetting::appRemovalAllowed), RestrictionValue::unset);
  EXPECT_EQ(settings.storeFolder(), std::nullopt);
  EXPECT_EQ(settings.assertionAnswer("com.a"), std::nullopt);
}

TEST_F(SettingsTest, StoresValuesByKeyAndAssertionsByApp) {
  EXPECT_TRUE(settings.assign("coordination=off"));
  EXPECT_TRUE(settings.assign("assertion=com.b:failing"));
  EXPECT_TRUE(settings.assign("assertion=com.a:denied"));
  EXPECT_TRUE(settings.assign("app-removal=no"));
  EXPECT_TRUE(settings.assign("app-installation=yes"));
  EXPECT_EQ(rows(), (Lines{"app-installation yes", "app-removal no", "assertion com.a denied",
                           "assertion com.b failing", "coordination off"}));
}

TEST_F(SettingsTest, ReplacesEarlierValue) {
  EXPECT_TRUE(settings.set("app-removal", "no"));
  EXPECT_TRUE(settings.set("app-removal", "yes"));
  EXPECT_EQ(rows(), Lines{"app-removal yes"});
}

TEST_F(SettingsTest, UnsetRemovesSetting) {
  EXPECT_TRUE(settings.set("app-removal", "no"));
  EXPECT_TRUE(settings.set("assertion", "com.a:denied"));
  EXPECT_TRUE(settings.set("coordination", "off"));
  for (const char* assignment : {"app-removal=unset", "assertion=com.a:unset", "coordination=unset", "store=unset"}) {
    EXPECT_TRUE(settings.assign(assignment)) << assignment;
  }
  EXPECT_EQ(rows(), Lines{});
}

TEST_F(SettingsTest, SurvivesRestart) {
  EXPECT_TRUE(settings.set("app-installation", "no"));
  database.reopen();
  EXPECT_EQ(Settings(database).restriction(RestrictionSetting::appInstallationAllowed), RestrictionValue::no);
}

TEST_F(SettingsTest, ReadersSeeSettings) {
  EXPECT_TRUE(settings.set("app-installation", "no"));
  const auto other = database.openReadOnly();
  Settings reader(*other);
  EXPECT_EQ(reader.restriction(RestrictionSetting::appInstallationAllowed), RestrictionValue::no);
  EXPECT_FALSE(reader.set("app-installation", "yes"));
  EXPECT_TRUE(settings.set("app-installation", "yes"));
  EXPECT_EQ(reader.restriction(RestrictionSetting::appInstallationAllowed), RestrictionValue::yes);
}

TEST_F(SettingsTest, RejectsUnknownKeyAndListsKeys) {
  EXPECT_EQ(
      refusalOf("colour=blue"),
      refusal(SettingsFailure::unknownKey,
              "unknown setting \"colour\"; the settings are app-installation, app-removal, assertion, coordination, "
              "store"));
}

TEST_F(SettingsTest, RejectsUnknownValueAndListsValues) {
  EXPECT_EQ(
      refusalOf("app-removal=maybe"),
      refusal(SettingsFailure::unknownValue, "setting app-removal cannot be \"maybe\": it takes yes, no or unset"));
  EXPECT_EQ(
      refusalOf("coordination=perhaps"),
      refusal(SettingsFailure::unknownValue, "setting coordination cannot be \"perhaps\": it takes on, off or unset"));
  EXPECT_EQ(
      refusalOf("app-installation="),
      refusal(SettingsFailure::unknownValue, "setting app-installation cannot be \"\": it takes yes, no or unset"));
  EXPECT_EQ(rows(), Lines{});
}

TEST_F(SettingsTest, AssertionNeedsAppAndAnswer) {
  for (const char* value : {"com.a", "com.a:", "com.a:no", ":denied", "", ":"}) {
    EXPECT_EQ(refusalOf(std::string("assertion=") + value),
              refusal(SettingsFailure::unknownValue,
                      std::string("setting assertion cannot be \"") + value +
                          "\": it takes ID:granted, ID:denied, ID:unknown, ID:failing or ID:unset"));
  }
}

TEST_F(SettingsTest, CoordinationIsOffByDefault) {
  EXPECT_FALSE(settings.coordinationIsOn());
  EXPECT_TRUE(settings.assign("coordination=on"));
  EXPECT_TRUE(settings.coordinationIsOn());
  EXPECT_EQ(rows(), Lines{"coordination on"});
  EXPECT_TRUE(settings.assign("coordination=off"));
  EXPECT_FALSE(settings.coordinationIsOn());
  EXPECT_TRUE(settings.assign("coordination=on"));
  EXPECT_TRUE(settings.assign("coordination=unset"));
  EXPECT_FALSE(settings.coordinationIsOn());
}

TEST_F(SettingsTest, RejectsAssignmentWithoutEqualsSign) {
  EXPECT_EQ(refusalOf("app-removal"),
            refusal(SettingsFailure::noAssignment, "\"app-removal\" is not of the form KEY=VALUE"));
}

TEST_F(SettingsTest, StoresAbsolutePathOfStore) {
  const TemporaryFolder folder;
  std::filesystem::create_directory(folder.path("store"));
  EXPECT_TRUE(settings.set("store", folder.path("./store/../store")));
  EXPECT_EQ(settings.storeFolder(), std::filesystem::canonical(folder.path("store")).string());
}

TEST_F(SettingsTest, RejectsStoreThatIsNotAFolder) {
  EXPECT_EQ(refusalOf("store=/does/not/exist"),
            refusal(SettingsFailure::unknownValue,
                    "setting store cannot be \"/does/not/exist\": it takes an existing folder or unset"));
  EXPECT_FALSE(settings.set("store", "/dev/null"));
  EXPECT_FALSE(settings.set("store", ""));
}

TEST_F(SettingsTest, StoresAssertionAnswersPerApp) {
  for (const auto answer :
       {AssertionAnswer::granted, AssertionAnswer::denied, AssertionAnswer::unknown, AssertionAnswer::failing}) {
    EXPECT_TRUE(settings.setAssertionAnswer("com.a", answer));
    EXPECT_EQ(settings.assertionAnswer("com.a"), answer);
  }
  EXPECT_EQ(settings.assertionAnswer("com.A"), std::nullopt);
}

TEST_F(SettingsTest, UnreadableSettingsAreUnset) {
  EXPECT_TRUE(settings.set("app-removal", "no"));
  database.drop("settings");
  EXPECT_EQ(settings.restriction(RestrictionSetting::appRemovalAllowed), RestrictionValue::unset);
  EXPECT_FALSE(settings.set("app-removal", "no"));
}

TEST_F(SettingsTest, RestrictionsFollowSettings) {
  device::Restrictions restrictions(settings);
  EXPECT_EQ(restrictions.effectiveBoolValueForSetting(RestrictionSetting::appRemovalAllowed), RestrictionValue::unset);
  EXPECT_TRUE(settings.set("app-removal", "no"));
  EXPECT_EQ(restrictions.effectiveBoolValueForSetting(RestrictionSetting::appRemovalAllowed), RestrictionValue::no);
  EXPECT_EQ(restrictions.effectiveBoolValueForSetting(RestrictionSetting::appInstallationAllowed),
            RestrictionValue::unset);
  EXPECT_TRUE(settings.set("app-installation", "yes"));
  EXPECT_EQ(restrictions.effectiveBoolValueForSetting(RestrictionSetting::appInstallationAllowed),
            RestrictionValue::yes);
}

}  // namespace
}  // namespace appsync::test
