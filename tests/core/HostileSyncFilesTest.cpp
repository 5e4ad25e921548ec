// Lists from the host and from disk that nobody should have written.
#include <algorithm>
#include <cstddef>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

constexpr std::string_view kLastSyncState = "/var/mobile/Library/ApplicationSync/LastSyncAppState.plist";
constexpr std::string_view kRestoreState = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

struct HostileFile {
  const char* name;
  std::function<std::string()> contents;
};

std::string textForm(const Bytes& bytes) {
  return std::string(textOf(bytes));
}

std::string replaced(std::string text, std::string_view what, std::string_view by) {
  for (std::size_t at = text.find(what); at != std::string::npos; at = text.find(what, at + by.size()))
    text.replace(at, what.size(), by);
  return text;
}

std::string nested(std::size_t depth) {
  std::string xml = "<plist>";
  for (std::size_t level = 0; level < depth; ++level)
    xml += "<array>";
  for (std::size_t level = 0; level < depth; ++level)
    xml += "</array>";
  return xml + "</plist>";
}

const std::vector<HostileFile>& hostileFiles() {
  static const std::vector<HostileFile> kFiles{
      {"Empty", [] { return std::string(); }},
      {"OneNul", [] { return std::string(1, '\0'); }},
      {"BinaryHeaderOnly", [] { return std::string("bplist00"); }},
      {"Garbage", [] { return std::string(4096, '\xfe'); }},
      {"Dictionary", [] { return textForm(xmlForm(removeEntry("com.a"))); }},
      {"Number", [] { return textForm(binaryForm(7)); }},
      {"String", [] { return textForm(binaryForm("com.a")); }},
      {"IdentifierNotUTF8InXML",
       [] { return replaced(textForm(xmlForm(plist::Array{removeEntry("com.XX")})), "XX", "\xc3\x28"); }},
      {"IdentifierNotUTF8InBinary",
       [] { return replaced(textForm(binaryForm(plist::Array{removeEntry("com.XX")})), "XX", "\xc3\x28"); }},
      {"ScalarsOnly",
       [] {
         return textForm(binaryForm(plist::Array{1, true, 2.5, "com.a", plist::Uid{3}}));
       }},
      {"ArraysOfArrays",
       [] { return textForm(xmlForm(plist::Array{plist::Value(plist::Array{removeEntry("com.a")})})); }},
      {"EmptyDictionaries",
       [] {
         return textForm(xmlForm(plist::Array{plist::Dictionary{}, plist::Dictionary{}}));
       }},
      {"IdentifiersOfOtherTypes",
       [] {
         plist::Array list;
         for (const plist::Value& odd :
              {plist::Value(7), plist::Value(true), plist::Value(plist::Date{1}), plist::Value(plist::Array{"com.a"}),
               plist::Value(plist::Dictionary{{"identifier", "com.a"}}), plist::Value::data(bytesOf("com.a"))})
           list.emplace_back(plist::Dictionary{{"identifier", odd}, {"operation", "remove"}});
         return textForm(binaryForm(list));
       }},
      {"OperationsOfOtherTypes",
       [] {
         plist::Array list;
         for (const plist::Value& odd :
              {plist::Value(7), plist::Value(plist::Array{"remove"}), plist::Value("explode")})
           list.emplace_back(plist::Dictionary{{"identifier", "com.a"}, {"operation", odd}});
         return textForm(binaryForm(list));
       }},
      {"TooDeep", [] { return nested(100'000); }},
      {"EntityDeclaration",
       [] {
         return std::string(
             R"(<!DOCTYPE plist [<!ENTITY a "aaaa">]><plist><array><string>&a;</string></array></plist>)");
       }},
  };
  return kFiles;
}

/// No file of these makes an app go, and none makes anything fail.
class HostileSyncFiles : public ClientFixture, public testing::WithParamInterface<HostileFile> {
 protected:
  AppsClient& client = makeClient();
  std::string contents = GetParam().contents();

  void putInstalledApp() { platform.registry.add(FakeApp::installed("com.a")); }
};

class OddIdentifiers : public ClientFixture {
 protected:
  AppsClient& client = makeClient();

  [[nodiscard]] std::vector<std::string> removedBy(plist::Array list) {
    platform.files.put(kStagedTodoListPath, binaryForm(std::move(list)));
    EXPECT_TRUE(client.reconcileSync({}, "", nullptr, nullptr));
    std::vector<std::string> identifiers;
    for (const auto& uninstall : platform.registry.uninstalls())
      identifiers.push_back(uninstall.identifier);
    return identifiers;
  }
};

}  // namespace

TEST_P(HostileSyncFiles, AsATodoListRemoveNothingAtReconcile) {
  putInstalledApp();
  platform.files.put(kStagedTodoListPath, contents);
  std::optional<Error> error;
  EXPECT_TRUE(client.reconcileSync({}, "anchor", nullptr, &error));
  EXPECT_TRUE(platform.registry.uninstalls().empty());
  EXPECT_EQ(platform.files.text(kTodoListPath), contents);
  EXPECT_EQ(platform.notify.posts().size(), 1U);
  EXPECT_EQ(platform.log.messages().back(), "finished reconcile sync");
}

TEST_P(HostileSyncFiles, AsATodoListDoNotHideDeletedApps) {
  platform.uninstalledList.add("com.b");
  platform.files.put(kTodoListPath, contents);
  EXPECT_EQ(client.installedAssets(),
            (plist::Dictionary{{"_Deleted", plist::Array{plist::Dictionary{{"BundleIdentifier", "com.b"}}}}}));
}

/// One long text that is referred to as often as a list may.
TEST_F(OddIdentifiers, AListThatPrintsFarLongerThanItIsIsCutInTheLog) {
  constexpr std::size_t kLongText = 200'000;
  const plist::Array list(30, plist::Dictionary{{"identifier", "com.a"}, {"name", std::string(kLongText, 'x')}});
  const Bytes document = binaryForm(list);
  EXPECT_LT(document.size(), 2 * kLongText);
  platform.files.put(kTodoListPath, document);
  static_cast<void>(client.installedAssets());
  static_cast<void>(client.outstandingAssetTransfers());
  std::size_t longest = 0;
  for (const std::string& message : platform.log.messages())
    longest = std::max(longest, message.size());
  EXPECT_GT(longest, kLongText);
  EXPECT_LT(longest, 10 * kLongText);
}

TEST_P(HostileSyncFiles, AsLastSyncStateReportNoAppThatIsThere) {
  putInstalledApp();
  platform.files.put(kLastSyncState, contents);
  const plist::Dictionary report = client.installedAssets();
  EXPECT_TRUE(report.find("_Deleted")->array()->empty());
}

TEST_P(HostileSyncFiles, AsATodoListStayAsTheyAreWhenAnotherAppsWordChanges) {
  platform.files.put(kTodoListPath, contents);
  client.changeAssetID("com.b", "INSTALLED");
  EXPECT_EQ(client._operationStateForIdentifier("com.b"), std::nullopt);
  EXPECT_EQ(platform.files.text(kTodoListPath), contents);
}

TEST_P(HostileSyncFiles, AsATodoListAreOutlivedByAWholeSync) {
  platform.files.put(kStagedTodoListPath, contents);
  EXPECT_TRUE(client.prepareForSyncWithHostAnchor("", nullptr, nullptr));
  static_cast<void>(client.installedAssets());
  EXPECT_TRUE(client.reconcileSync({}, "", nullptr, nullptr));
  EXPECT_TRUE(client.outstandingAssetTransfers().empty());
  client.assetTransferEndedWithSuccess(true);
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(platform.registry.installs().empty());
}

TEST_P(HostileSyncFiles, AsRestoreStateReadAsNothing) {
  platform.files.put(kRestoreState, contents);
  const plist::Value version("1.0");
  EXPECT_EQ(client._restoreStatePropertyForKey("path", "com.a", &version), std::nullopt);
}

TEST_P(HostileSyncFiles, AsRestoreStateGoOrStayUsableWhenAnAppIsCleaned) {
  platform.files.put(kRestoreState, contents);
  client.cleanRestoreStateForIdentifier("com.a");
  const auto left = propertyListAt(platform.files, kRestoreState);
  EXPECT_EQ(platform.files.has(kRestoreState), left.has_value());
  const plist::Value version("1.0");
  client._setRestoreStatePropertyValue("/p", "path", "com.a", &version);
  EXPECT_EQ(client._restoreStatePropertyForKey("path", "com.a", &version), plist::Value("/p"));
}

TEST_P(HostileSyncFiles, AsIconOrderKeepEveryItem) {
  platform.screen.setFlattenedIconState(Bytes(bytesOf(contents).begin(), bytesOf(contents).end()));
  std::map<std::string, int, std::less<>> items{{"com.x", 1}, {"com.y", 2}};
  EXPECT_EQ(AppsClient::_orderTheItems(platform, items), (std::vector<int>{1, 2}));
}

INSTANTIATE_TEST_SUITE_P(Files, HostileSyncFiles, testing::ValuesIn(hostileFiles()),
                         [](const testing::TestParamInfo<HostileFile>& file) { return file.param.name; });

TEST_F(OddIdentifiers, EmptyAndDottedIdentifiersAreHandedToTheRegistryAsTheyAre) {
  EXPECT_EQ(removedBy({removeEntry(""), removeEntry(".."), removeEntry("../com.a"), removeEntry("/com.a")}),
            (std::vector<std::string>{"", "..", "../com.a", "/com.a"}));
}

TEST_F(OddIdentifiers, NoIdentifierThatClimbsIsHandedToTheRegistry) {
  EXPECT_TRUE(
      removedBy({removeEntry("/.."), removeEntry("com.a/.."), removeEntry("com.a/../../etc"), removeEntry("com.a/...")})
          .empty());
}

TEST_F(OddIdentifiers, AnIdentifierOf64KilobytesIsTakenWhole) {
  const std::string identifier(65'536, 'a');
  platform.registry.add(FakeApp::installed(identifier));
  EXPECT_EQ(removedBy({removeEntry(identifier)}), std::vector<std::string>{identifier});
  EXPECT_TRUE(platform.log.contains(logged(identifier + " targeted for termination")));
}

TEST_F(OddIdentifiers, AnIdentifierWithFormatLettersIsPrintedAsItIs) {
  EXPECT_EQ(removedBy({removeEntry("%s%n%{public}@")}), std::vector<std::string>{"%s%n%{public}@"});
  EXPECT_TRUE(platform.log.contains(logged("%s%n%{public}@ targeted for termination")));
}

TEST_F(OddIdentifiers, OtherScriptsAndControlCharactersAreKept) {
  const std::vector<std::string> identifiers{"com.\xE3\x82\xA2\xF0\x9F\x8D\x8E", "com.a\nb", std::string("com.\0a", 6)};
  plist::Array list;
  for (const std::string& identifier : identifiers)
    list.emplace_back(removeEntry(identifier));
  EXPECT_EQ(removedBy(list), identifiers);
}

TEST_F(OddIdentifiers, AHundredThousandRemovalsAreAllMadeInOrder) {
  constexpr std::size_t kEntries = 100'000;
  plist::Array list;
  for (std::size_t number = 0; number < kEntries; ++number)
    list.emplace_back(removeEntry("com.app" + std::to_string(number)));
  const std::vector<std::string> removed = removedBy(std::move(list));
  ASSERT_EQ(removed.size(), kEntries);
  EXPECT_EQ(removed.front(), "com.app0");
  EXPECT_EQ(removed.back(), "com.app99999");
  EXPECT_TRUE(platform.log.contains(logged("performing 100000 deletions")));
}

TEST_F(OddIdentifiers, ChangingTheLastOfAHundredThousandEntriesKeepsTheOthers) {
  constexpr std::size_t kEntries = 100'000;
  plist::Array list;
  for (std::size_t number = 0; number < kEntries; ++number)
    list.emplace_back(installEntry("com.app" + std::to_string(number)));
  platform.files.put(kTodoListPath, binaryForm(list));
  client.changeAssetID("com.app99999", "INSTALLED");
  list.back().dictionary()->set("operation", "INSTALLED");
  EXPECT_EQ(propertyListAt(platform.files, kTodoListPath), plist::Value(std::move(list)));
}

}  // namespace appsync::test
