// Which apps on the device are placeholders.
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/TextDiff.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

using platform::BundleKind;
using platform::kApplicationTypeSystem;

class PlaceholderExists : public ClientFixture {};

class EnumeratePlaceholders : public ClientFixture {
 protected:
  AppsClient& client = makeClient();

  std::vector<std::string> visited() {
    std::vector<std::string> identifiers;
    client._enumeratePlaceholdersWithBlock([&](const platform::AppRecord& record, bool&) {
      EXPECT_TRUE(record.isPlaceholder());
      identifiers.push_back(record.applicationIdentifier());
    });
    return identifiers;
  }
};

class SystemAppPlaceholders : public ClientFixture {
 protected:
  AppsClient& client = makeClient();
};

}  // namespace

TEST_F(PlaceholderExists, APlaceholderIsFoundAndLogged) {
  AppsClient& client = makeClient();
  platform.registry.add(FakeApp::placeholder("com.a"));
  logCalls(platform);
  EXPECT_TRUE(client._placeholderExistsForApplication("com.a"));
  EXPECT_TRUE(
      sameLines(LogLines{called("registry.enumerateBundlesOfType 1"), logged("Found placeholder for bundle com.a")},
                platform.log.lines()));
}

TEST_F(PlaceholderExists, AnUnknownAppIsNotFoundAndNotLogged) {
  AppsClient& client = makeClient();
  platform.registry.add(FakeApp::placeholder("com.a"));
  EXPECT_FALSE(client._placeholderExistsForApplication("com.b"));
  EXPECT_FALSE(client._placeholderExistsForApplication(""));
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(PlaceholderExists, AnEmptyRegistryHoldsNone) {
  EXPECT_FALSE(makeClient()._placeholderExistsForApplication("com.a"));
}

TEST_F(PlaceholderExists, WithInstallCoordinationTheAnswerIsNoWithoutAskingTheRegistry) {
  platform.coordination.enable();
  AppsClient& client = makeClient();
  platform.registry.add(FakeApp::placeholder("com.a"));
  EXPECT_FALSE(client._placeholderExistsForApplication("com.a"));
  EXPECT_TRUE(platform.journal.lines().empty());
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(PlaceholderExists, TheWalkStopsAtTheFirstOfTwoBundlesWithOneIdentifier) {
  AppsClient& client = makeClient();
  platform.registry.addBundle("com.a", BundleKind::user);
  platform.registry.addBundle("com.a", BundleKind::user);
  EXPECT_TRUE(client._placeholderExistsForApplication("com.a"));
  EXPECT_TRUE(sameLines(LogLines{logged("Found placeholder for bundle com.a")}, platform.log.lines()));
}

TEST_F(PlaceholderExists, AnyUserBundleCountsPlaceholderOrNot) {
  AppsClient& client = makeClient();
  platform.registry.add(FakeApp::installed("com.installed"));
  platform.registry.addBundle("com.bundle", BundleKind::user);
  EXPECT_TRUE(client._placeholderExistsForApplication("com.installed"));
  EXPECT_TRUE(client._placeholderExistsForApplication("com.bundle"));
}

TEST_F(PlaceholderExists, BundlesOfOtherKindsDoNotCount) {
  AppsClient& client = makeClient();
  platform.registry.add(FakeApp::placeholder("com.system").ofType(kApplicationTypeSystem));
  platform.registry.addBundle("com.other", BundleKind::all);
  EXPECT_FALSE(client._placeholderExistsForApplication("com.system"));
  EXPECT_FALSE(client._placeholderExistsForApplication("com.other"));
}

TEST_F(PlaceholderExists, IdentifiersThatDifferInCaseOnlyDoNotMatch) {
  AppsClient& client = makeClient();
  platform.registry.add(FakeApp::placeholder("com.App"));
  EXPECT_FALSE(client._placeholderExistsForApplication("com.app"));
  EXPECT_FALSE(client._placeholderExistsForApplication("com.Ap"));
  EXPECT_FALSE(client._placeholderExistsForApplication("com.App "));
  EXPECT_TRUE(client._placeholderExistsForApplication("com.App"));
}

TEST_F(EnumeratePlaceholders, PlaceholdersOfUsersAndOfTheSystemAreVisited) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.registry.add(FakeApp::placeholder("com.s").ofType(kApplicationTypeSystem));
  platform.registry.add(FakeApp::updating("com.u"));
  platform.journal.clear();
  EXPECT_EQ(visited(), (std::vector<std::string>{"com.a", "com.s", "com.u"}));
  EXPECT_TRUE(sameLines({"registry.enumerateBundlesOfType 0"}, platform.journal.lines()));
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(EnumeratePlaceholders, ABundleThatIsNoAppIsNotVisited) {
  platform.registry.addBundle("com.extension", BundleKind::all);
  platform.registry.addBundle("com.bundle", BundleKind::user);
  EXPECT_TRUE(visited().empty());
}

TEST_F(EnumeratePlaceholders, AnInstalledAppIsNotVisited) {
  platform.registry.add(FakeApp::installed("com.a"));
  EXPECT_TRUE(visited().empty());
}

TEST_F(EnumeratePlaceholders, AnEmptyRegistryMakesNoCallback) {
  EXPECT_TRUE(visited().empty());
}

TEST_F(EnumeratePlaceholders, TheCallbackCanEndTheWalk) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    platform.registry.add(FakeApp::placeholder(identifier));
  std::vector<std::string> identifiers;
  client._enumeratePlaceholdersWithBlock([&](const platform::AppRecord& record, bool& stop) {
    identifiers.push_back(record.applicationIdentifier());
    stop = identifiers.size() == 2;
  });
  EXPECT_EQ(identifiers, (std::vector<std::string>{"com.a", "com.b"}));
}

TEST_F(EnumeratePlaceholders, TheCallbackMayUninstallWhatItVisits) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    platform.registry.add(FakeApp::placeholder(identifier));
  client._enumeratePlaceholdersWithBlock([&](const platform::AppRecord& record, bool&) {
    EXPECT_TRUE(platform.registry.uninstallApplication(record.applicationIdentifier()));
  });
  EXPECT_TRUE(platform.registry.identifiers().empty());
}

TEST_F(SystemAppPlaceholders, OnlyPlaceholdersOfSystemAppsAreCollected) {
  platform.registry.add(FakeApp::placeholder("com.s2").ofType(kApplicationTypeSystem));
  platform.registry.add(FakeApp::placeholder("com.s1").ofType(kApplicationTypeSystem));
  platform.registry.add(FakeApp::installed("com.s3").ofType(kApplicationTypeSystem));
  platform.registry.add(FakeApp::placeholder("com.user"));
  platform.registry.addBundle("com.bundle", BundleKind::system);
  logCalls(platform);
  EXPECT_EQ(client._getSystemAppPlaceholders(), (IdentifierSet{"com.s1", "com.s2"}));
  EXPECT_TRUE(
      sameLines(LogLines{called("registry.enumerateBundlesOfType 7"), logged("SystemAppPlaceholders (com.s1, com.s2)")},
                platform.log.lines()));
}

TEST_F(SystemAppPlaceholders, WithoutAnyTheEmptySetIsLoggedAndReturned) {
  EXPECT_TRUE(client._getSystemAppPlaceholders().empty());
  EXPECT_TRUE(sameLines(LogLines{logged("SystemAppPlaceholders ()")}, platform.log.lines()));
}

}  // namespace appsync::test
