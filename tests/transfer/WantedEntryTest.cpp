// One app that the device is to get, as the host or a placeholder asks for it.
#include <gtest/gtest.h>

#include "base/Describe.h"
#include "kit/fakes/FakeApp.h"
#include "transfer/WantedEntry.h"

namespace appsync::test {
namespace {

using platform::TSInstallType;

WantedEntry of(const FakeApp& app) {
  return WantedEntry::fromPlaceholder(FakeAppRecord(app));
}

TEST(WantedEntry, APlaceholderGivesItsRecordAndItsFlags) {
  EXPECT_EQ(of(FakeApp::placeholder("com.a", TSInstallType::Restore)
                   .withVersion("2")
                   .withContainerPath("/c")
                   .withBundlePath("/c/A.app"))
                .values(),
            plist::Value(plist::Dictionary{{"BundleIdentifier", "com.a"},
                                           {"BundleVersion", "2"},
                                           {"Container", "/c"},
                                           {"Path", "/c/A.app"},
                                           {"IsRestore", 1},
                                           {"intentional_demoted_app", 0},
                                           {"auto_demoted_app", 0},
                                           {"system_app", false}}));
}

TEST(WantedEntry, TheInstallTypeTellsRestoresAndDemotions) {
  const WantedEntry intentional = of(FakeApp::placeholder("com.a", TSInstallType{8}));
  EXPECT_TRUE(intentional.isIntentionallyDemoted());
  EXPECT_FALSE(intentional.isAutomaticallyDemoted() || intentional.isRestore());
  const WantedEntry automatic = of(FakeApp::placeholder("com.a", TSInstallType::Downgrade));
  EXPECT_TRUE(automatic.isAutomaticallyDemoted());
  EXPECT_FALSE(automatic.isIntentionallyDemoted() || automatic.isRestore());
  EXPECT_TRUE(of(FakeApp::placeholder("com.a").ofType("System")).isSystemApp());
  EXPECT_FALSE(of(FakeApp::placeholder("com.a").ofType("system")).isSystemApp());
}

TEST(WantedEntry, WhatARecordDoesNotKnowIsAbsent) {
  const WantedEntry entry = of(FakeApp::placeholder("com.a")
                                   .withBundleIdentifier(std::nullopt)
                                   .withVersion(std::nullopt)
                                   .withContainerPath(std::nullopt)
                                   .withBundlePath(std::nullopt));
  EXPECT_EQ(entry.values().dictionary()->size(), 4U);
  EXPECT_EQ(entry.version(), nullptr);
  EXPECT_EQ(entry.path(), std::nullopt);
  EXPECT_EQ(entry.container(), std::nullopt);
}

TEST(WantedEntry, ATodoEntryGivesTheFolderThatTheHostStaged) {
  const plist::Value todo =
      plist::Dictionary{{"identifier", "com.a"}, {"operation", "install"}, {"version", "3"}, {"name", "A"}};
  constexpr std::string_view kStaged = "/var/mobile/Library/ApplicationSync/HarvoStuff/com.a";
  const WantedEntry entry = WantedEntry::fromTodoEntry(todo, "com.a");
  EXPECT_EQ(entry.values(), plist::Value(plist::Dictionary{{"BundleIdentifier", "com.a"},
                                                           {"BundleVersion", "3"},
                                                           {"Container", kStaged},
                                                           {"Path", kStaged},
                                                           {"NameFromHarvo", "A"}}));
  EXPECT_FALSE(entry.isRestore() || entry.isSystemApp() || entry.isAutomaticallyDemoted() ||
               entry.isIntentionallyDemoted());
}

TEST(WantedEntry, ValuesOfAWrongTypeAreKeptAsVersionAndDroppedAsName) {
  const plist::Value todo = plist::Dictionary{{"version", 3}, {"name", plist::Array{}}};
  const WantedEntry entry = WantedEntry::fromTodoEntry(todo, "com.a");
  EXPECT_EQ(*entry.version(), plist::Value(3));
  EXPECT_EQ(entry.nameFromHost(), std::nullopt);
}

TEST(WantedEntry, SeveralAreDescribedAsOneDictionary) {
  WantedEntries entries;
  entries.emplace("com.a", WantedEntry::fromTodoEntry(plist::Dictionary{}, "com.a"));
  EXPECT_EQ(description(DescribedEntries{entries}),
            description(plist::Value(plist::Dictionary{{"com.a", entries.at("com.a").values()}})));
}

}  // namespace
}  // namespace appsync::test
