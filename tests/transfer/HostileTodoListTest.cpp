// Todo lists that no well-meaning host writes.
#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

constexpr std::string_view kOwnFolder = "/var/mobile/Library/ApplicationSync/";
constexpr std::string_view kPlaceholders = "/tmp/com.corvel.zeph.Apps/";

/// Calls of the platform that a todo list of so many apps costs.
std::size_t callsFor(std::size_t apps) {
  FakePlatform platform;
  for (const int category : {8, 14})
    platform.log.disable(category);
  plist::Array entries;
  entries.reserve(apps);
  for (std::size_t number = 0; number < apps; ++number)
    entries.emplace_back(entry("com.app" + std::to_string(number), "install"));
  platform.files.put(kTodoListPath, binaryForm(std::move(entries)));
  const auto client = AppsClient::create(platform);
  const std::size_t before = platform.journal.callCount();
  EXPECT_EQ(client->outstandingAssetTransfers().size(), apps);
  return platform.journal.callCount() - before;
}

class HostileTodoList : public ClientFixture {
 protected:
  void SetUp() override { platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff"); }

  platform::Assets outstandingFor(const plist::Array& entries) { return outstandingFor(binaryForm(entries)); }

  platform::Assets outstandingFor(const Bytes& document) {
    platform.files.put(kTodoListPath, document);
    AppsClient& client = makeClient();
    platform.log.clear();
    return client.outstandingAssetTransfers();
  }

  /// Everything but what the plug-in may write.
  [[nodiscard]] std::vector<std::string> foreignPaths() {
    std::vector<std::string> paths = platform.files.paths();
    std::erase_if(
        paths, [](const std::string& path) { return path.starts_with(kPlaceholders) || path.starts_with(kOwnFolder); });
    return paths;
  }
};

TEST_F(HostileTodoList, TheWorkGrowsAsTheListDoes) {
  const std::size_t none = callsFor(0);
  const std::size_t perApp = callsFor(1) - none;
  EXPECT_EQ(callsFor(20'000), none + 20'000 * perApp);
}

TEST_F(HostileTodoList, AHundredThousandAppsThatMayNotBeInstalledAreSkippedOneByOne) {
  platform.log.disable(8, LogLevel::standard);
  platform.restrictions.set(platform::RestrictionSetting::appInstallationAllowed, platform::RestrictionValue::no);
  plist::Array entries;
  for (int number = 0; number < 100'000; ++number)
    entries.emplace_back(entry("com.app" + std::to_string(number), "install"));
  EXPECT_TRUE(outstandingFor(entries).empty());
  EXPECT_EQ(platform.journal.count("bundles.openBundle"), 100'000U);
}

TEST_F(HostileTodoList, OneAppAHundredThousandTimesIsOneApp) {
  platform.log.disable(8, LogLevel::standard);
  const plist::Array entries(100'000, entry("com.a", "install"));
  EXPECT_EQ(outstandingFor(entries).size(), 1U);
  EXPECT_EQ(platform.registry.installs().size(), 1U);
}

TEST_F(HostileTodoList, AnEmptyIdentifierIsNoAppsPlaceholder) {
  const auto assets = outstandingFor(plist::Array{installEntry("")});
  ASSERT_EQ(assets.size(), 1U);
  EXPECT_EQ(assets[0]->identifier(), "");
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_FALSE(platform.files.has(kPlaceholders));
}

TEST_F(HostileTodoList, IdentifiersMadeOfDotsStayInThePlugInsFolders) {
  const std::vector<std::string> before = foreignPaths();
  const auto assets = outstandingFor(plist::Array{installEntry(".."), installEntry("."), installEntry("...")});
  EXPECT_EQ(assets.size(), 3U);
  EXPECT_EQ(foreignPaths(), before);
}

TEST_F(HostileTodoList, AnIdentifierThatLeadsOutOfThePlaceholdersFolderHasNone) {
  constexpr std::string_view kForeign = "another process's";
  platform.files.put("/tmp/Other.app/Info.plist", kForeign);
  platform.files.put("/tmp/Other.app/Icon.png", kForeign);
  const std::vector<std::string> before = foreignPaths();
  EXPECT_EQ(outstandingFor(plist::Array{installEntry("../Other"), installEntry("com.b")}).size(), 2U);
  EXPECT_EQ(foreignPaths(), before);
  EXPECT_EQ(platform.files.text("/tmp/Other.app/Info.plist"), kForeign);
  EXPECT_EQ(platform.files.text("/tmp/Other.app/Icon.png"), kForeign);
  EXPECT_EQ(platform.registry.identifiers(), std::vector<std::string>{"com.b"});
  EXPECT_TRUE(
      platform.log.contains(logged("Created app directory for '../Other' at /tmp/com.corvel.zeph.Apps/../Other.app "
                                   "with err=" +
                                   description(Error::fromErrno(EINVAL)))));
}

TEST_F(HostileTodoList, ClimbingIdentifierHasNoIconBesideTheFolder) {
  constexpr std::string_view kBeside = "/var/mobile/Library/ApplicationSync/Other.png";
  putAppFolder(platform.files, "/var/mobile/Library/ApplicationSync/HarvoStuff/../Other", "../Other", "Other");
  putAppFolder(platform.files, "/var/mobile/Library/ApplicationSync/Other", "../Other", "Other");
  platform.files.put(kBeside, "another file");
  EXPECT_EQ(outstandingFor(plist::Array{installEntry("../Other")}).size(), 1U);
  EXPECT_EQ(platform.files.text(kBeside), "another file");
  EXPECT_TRUE(platform.log.contains(
      loggedError("Couldn't save image file to /var/mobile/Library/ApplicationSync/Icons/../Other.png")));
}

TEST_F(HostileTodoList, AVeryLongIdentifierIsWantedLikeAnyOther) {
  const std::string identifier(64 * 1024, 'x');
  const auto assets = outstandingFor(plist::Array{installEntry(identifier), installEntry("com.b")});
  ASSERT_EQ(assets.size(), 2U);
  EXPECT_EQ(assets[0]->identifier(), "com.b");
  EXPECT_EQ(assets[1]->identifier(), identifier);
}

TEST_F(HostileTodoList, AnIdentifierWithANulHasNeitherIconNorStopsTheOthers) {
  const std::string identifier("com.a\0b", 7);
  const auto assets = outstandingFor(plist::Array{installEntry(identifier), installEntry("com.b")});
  ASSERT_EQ(assets.size(), 2U);
  EXPECT_EQ(assets[0]->identifier(), identifier);
  EXPECT_EQ(assets[0]->icon(), std::nullopt);
  EXPECT_TRUE(platform.registry.app("com.b")->isPlaceholder);
}

TEST_F(HostileTodoList, AListWithTextThatIsNoTextIsNone) {
  const std::string document =
      "<plist><array><dict><key>operation</key><string>install</string>"
      "<key>identifier</key><string>com.\xff\xfe</string></dict></array></plist>";
  const ByteView bytes = bytesOf(document);
  EXPECT_TRUE(outstandingFor(Bytes(bytes.begin(), bytes.end())).empty());
  EXPECT_TRUE(platform.log.contains(loggedError("couldn't parse todo list")));
}

TEST_F(HostileTodoList, AListThatIsNoListIsNone) {
  platform.registry.add(FakeApp::placeholder("com.a", platform::TSInstallType::Restore));
  EXPECT_EQ(outstandingFor(binaryForm(plist::Dictionary{{"0", installEntry("com.b")}})).size(), 1U);
  EXPECT_TRUE(platform.log.contains(loggedError("todo list is not an array")));
}

TEST_F(HostileTodoList, EntriesThatAreNoDictionariesAreNoApps) {
  plist::Array entries{7, "install", plist::Array{"install"}, plist::Dictionary{}, true, installEntry("com.a")};
  EXPECT_EQ(outstandingFor(entries).size(), 1U);
}

TEST_F(HostileTodoList, VersionAndNameOfAnyTypeAreEndured) {
  plist::Dictionary odd = entry("com.a", "install");
  odd.set("version", plist::Dictionary{{"a", plist::Array{1}}});
  odd.set("name", 5);
  const auto assets = outstandingFor(plist::Array{odd});
  ASSERT_EQ(assets.size(), 1U);
  EXPECT_EQ(assets[0]->prettyName(), "com.a");
  EXPECT_EQ(*assets[0]->variantOptions().find("Version"), *odd.find("version"));
}

}  // namespace
}  // namespace appsync::test
