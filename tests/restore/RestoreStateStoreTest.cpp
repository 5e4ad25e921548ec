// Where restored packages lie, across restarts.
#include <cerrno>
#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "common/RestoreState.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "kit/fakes/TextDiff.h"
#include "kit/fakes/Threads.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

constexpr std::string_view kStore = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

plist::Dictionary pathOf(const char* path) {
  return {{"path", path}};
}

class RestoreStateStore : public ClientFixture {
 protected:
  AppsClient& client = makeClient();
  RestoreStateStore() { platform.files.putFolder("/var/mobile/Library/ApplicationSync"); }

  void setPath(std::string_view identifier, const plist::Value& version, const char* path) {
    client._setRestoreStatePropertyValue(path, "path", identifier, &version);
  }
  std::optional<plist::Value> path(std::string_view identifier, const plist::Value& version) {
    return client._restoreStatePropertyForKey("path", identifier, &version);
  }
  std::optional<plist::Value> root() { return propertyListAt(platform.files, kStore); }
};

}  // namespace

TEST_F(RestoreStateStore, AFirstPropertyMakesTheFileWithItAlone) {
  setPath("com.a", "1.0", "/p");
  EXPECT_EQ(root(), plist::Value(plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", pathOf("/p")}}}}));
  EXPECT_EQ(path("com.a", "1.0"), plist::Value("/p"));
}

TEST_F(RestoreStateStore, TheFileIsXML) {
  setPath("com.a", "1.0", "/p");
  EXPECT_EQ(platform.files.contents(kStore),
            xmlForm(plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", pathOf("/p")}}}}));
}

TEST_F(RestoreStateStore, ItIsReadAndWrittenOnceForEachChange) {
  setPath("com.a", "1.0", "/p");
  EXPECT_TRUE(
      sameLines({"fileSystem.readFile " + std::string(kStore), "fileSystem.writeFileAtomically " + std::string(kStore)},
                platform.journal.lines()));
}

TEST_F(RestoreStateStore, NothingIsLogged) {
  setPath("com.a", "1.0", "/p");
  static_cast<void>(path("com.a", "1.0"));
  client.cleanRestoreStateForIdentifier("com.a");
  platform.files.put(kStore, "corrupt <");
  setPath("com.a", "1.0", "/p");
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(RestoreStateStore, ASecondVersionKeepsTheFirst) {
  setPath("com.a", "1.0", "/1");
  setPath("com.a", "2.0", "/2");
  EXPECT_EQ(path("com.a", "1.0"), plist::Value("/1"));
  EXPECT_EQ(path("com.a", "2.0"), plist::Value("/2"));
}

TEST_F(RestoreStateStore, CleaningTheLastIdentifierRemovesAllItsVersionsAndTheFile) {
  setPath("com.a", "1.0", "/1");
  setPath("com.a", "2.0", "/2");
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_FALSE(platform.files.has(kStore));
}

TEST_F(RestoreStateStore, CleaningOneIdentifierKeepsTheOthers) {
  setPath("com.a", "1.0", "/1");
  setPath("com.b", "1.0", "/2");
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_EQ(platform.files.contents(kStore),
            xmlForm(plist::Dictionary{{"com.b", plist::Dictionary{{"1.0", pathOf("/2")}}}}));
}

TEST_F(RestoreStateStore, CleaningAnUnknownIdentifierRewritesTheSame) {
  setPath("com.a", "1.0", "/1");
  const auto before = platform.files.contents(kStore);
  client.cleanRestoreStateForIdentifier("com.b");
  EXPECT_EQ(platform.files.contents(kStore), before);
  EXPECT_EQ(platform.files.writes(kStore), 2U);
}

TEST_F(RestoreStateStore, CleaningWithoutAFileDoesNothing) {
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_TRUE(sameLines({"fileSystem.readFile " + std::string(kStore)}, platform.journal.lines()));
}

TEST_F(RestoreStateStore, CleaningTheLastIdentifierOfAFileThatCannotBeRemovedIsNoFailure) {
  setPath("com.a", "1.0", "/1");
  platform.files.failures.failNext(FileOperation::removeItem, kStore, Error::fromErrno(EIO));
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_EQ(path("com.a", "1.0"), plist::Value("/1"));
}

TEST_F(RestoreStateStore, APropertyIsReplaced) {
  setPath("com.a", "1.0", "/1");
  setPath("com.a", "1.0", "/2");
  EXPECT_EQ(root(), plist::Value(plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", pathOf("/2")}}}}));
}

TEST_F(RestoreStateStore, OtherPropertiesOfAVersionStay) {
  const plist::Value version("1.0");
  setPath("com.a", version, "/1");
  client._setRestoreStatePropertyValue(plist::Array{1, 2}, "other", "com.a", &version);
  EXPECT_EQ(path("com.a", version), plist::Value("/1"));
  EXPECT_EQ(client._restoreStatePropertyForKey("other", "com.a", &version), plist::Value(plist::Array{1, 2}));
}

TEST_F(RestoreStateStore, AVersionThatIsNotStoredYieldsNothing) {
  setPath("com.a", "1.0", "/1");
  EXPECT_EQ(path("com.a", "2.0"), std::nullopt);
  EXPECT_EQ(path("com.a", ""), std::nullopt);
  EXPECT_EQ(path("com.b", "1.0"), std::nullopt);
  const plist::Value version("1.0");
  EXPECT_EQ(client._restoreStatePropertyForKey("other", "com.a", &version), std::nullopt);
}

TEST_F(RestoreStateStore, ReadingWithoutAFileYieldsNothing) {
  EXPECT_EQ(path("com.a", "1.0"), std::nullopt);
}

TEST_F(RestoreStateStore, ANullVersionReadsNothing) {
  setPath("com.a", "1.0", "/1");
  EXPECT_EQ(client._restoreStatePropertyForKey("path", "com.a", nullptr), std::nullopt);
}

TEST_F(RestoreStateStore, ANullVersionWritesNothing) {
  client._setRestoreStatePropertyValue("/1", "path", "com.a", nullptr);
  EXPECT_FALSE(platform.files.has(kStore));
}

TEST_F(RestoreStateStore, AVersionThatIsNoStringIsNoKey) {
  setPath("com.a", 1, "/1");
  EXPECT_FALSE(platform.files.has(kStore));
  setPath("com.a", "1", "/1");
  EXPECT_EQ(path("com.a", 1), std::nullopt);
}

TEST_F(RestoreStateStore, AnyFormOfPropertyListIsRead) {
  const plist::Dictionary stored{{"com.a", plist::Dictionary{{"1.0", pathOf("/p")}}}};
  platform.files.put(kStore, binaryForm(stored));
  EXPECT_EQ(path("com.a", "1.0"), plist::Value("/p"));
  platform.files.put(kStore, "{ \"com.a\" = { \"1.0\" = { path = \"/p\"; }; }; }");
  EXPECT_EQ(path("com.a", "1.0"), plist::Value("/p"));
  setPath("com.b", "1.0", "/q");
  EXPECT_EQ(path("com.a", "1.0"), plist::Value("/p"));
}

TEST_F(RestoreStateStore, AFileWhoseRootIsAnArrayReadsAsNothing) {
  putPropertyList(platform.files, kStore, plist::Array{plist::Dictionary{{"com.a", "1.0"}}});
  EXPECT_EQ(path("com.a", "1.0"), std::nullopt);
  EXPECT_EQ(path("", ""), std::nullopt);
}

TEST_F(RestoreStateStore, AFileWhoseRootIsAnArrayIsNotWrittenTo) {
  const Bytes before = xmlForm(plist::Array{"com.a"});
  platform.files.put(kStore, before);
  setPath("com.a", "1.0", "/1");
  EXPECT_EQ(platform.files.contents(kStore), before);
}

TEST_F(RestoreStateStore, AFileThatDoesNotParseReadsAsNothing) {
  platform.files.put(kStore, "<plist><dict>");
  EXPECT_EQ(path("com.a", "1.0"), std::nullopt);
}

TEST_F(RestoreStateStore, AFileThatDoesNotParseIsNotWrittenTo) {
  for (const char* corrupt : {"<plist><dict>", "bplist00", ""}) {
    platform.files.put(kStore, corrupt);
    setPath("com.a", "1.0", "/1");
    EXPECT_EQ(platform.files.text(kStore), corrupt);
  }
  EXPECT_EQ(platform.files.writes(kStore), 0U);
}

TEST_F(RestoreStateStore, CleaningAnyIdentifierRemovesAFileThatDoesNotParse) {
  for (const char* corrupt : {"<plist><dict>", "bplist00", ""}) {
    platform.files.put(kStore, corrupt);
    client.cleanRestoreStateForIdentifier("com.a");
    EXPECT_FALSE(platform.files.has(kStore)) << corrupt;
  }
}

TEST_F(RestoreStateStore, CleaningAnyIdentifierRemovesAFileWhoseRootIsNoDictionary) {
  putPropertyList(platform.files, kStore, plist::Array{"com.a"});
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_FALSE(platform.files.has(kStore));
}

TEST_F(RestoreStateStore, CleaningRemovesAnEmptyStore) {
  putPropertyList(platform.files, kStore, plist::Dictionary{});
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_FALSE(platform.files.has(kStore));
}

TEST_F(RestoreStateStore, WrongTypesAtAnyLevelReadAsNothing) {
  const plist::Value version("1.0");
  for (const plist::Value& wrong : {plist::Value(7), plist::Value("text"), plist::Value(plist::Array{"1.0", "path"})}) {
    putPropertyList(platform.files, kStore, plist::Dictionary{{"com.a", wrong}});
    EXPECT_EQ(path("com.a", version), std::nullopt);
    putPropertyList(platform.files, kStore, plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", wrong}}}});
    EXPECT_EQ(path("com.a", version), std::nullopt);
  }
}

TEST_F(RestoreStateStore, WrongTypesAtAnyLevelAreNotWrittenTo) {
  for (const plist::Value& wrong : {plist::Value(7), plist::Value("text"), plist::Value(plist::Array{"1.0", "path"})}) {
    for (const plist::Dictionary& stored :
         {plist::Dictionary{{"com.a", wrong}}, plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", wrong}}}}}) {
      putPropertyList(platform.files, kStore, stored);
      setPath("com.a", "1.0", "/1");
      EXPECT_EQ(root(), plist::Value(stored));
    }
  }
}

TEST_F(RestoreStateStore, WrongTypesUnderOneIdentifierLeaveTheOthersUsable) {
  putPropertyList(platform.files, kStore, plist::Dictionary{{"com.a", 7}});
  setPath("com.b", "1.0", "/1");
  EXPECT_EQ(path("com.b", "1.0"), plist::Value("/1"));
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_EQ(root(), plist::Value(plist::Dictionary{{"com.b", plist::Dictionary{{"1.0", pathOf("/1")}}}}));
}

TEST_F(RestoreStateStore, AStoredValueOfAnyTypeIsReturnedAsItIs) {
  putPropertyList(platform.files, kStore,
                  plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", plist::Dictionary{{"path", 7}}}}}});
  EXPECT_EQ(path("com.a", "1.0"), plist::Value(7));
}

TEST_F(RestoreStateStore, AFileThatCannotBeWrittenStaysAsItWas) {
  setPath("com.a", "1.0", "/1");
  platform.files.failures.failAlways(FileOperation::writeFileAtomically, kStore, Error::fromErrno(ENOSPC));
  setPath("com.b", "1.0", "/2");
  client.cleanRestoreStateForIdentifier("com.b");
  EXPECT_EQ(root(), plist::Value(plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", pathOf("/1")}}}}));
}

TEST_F(RestoreStateStore, AValueThatNoFileCanHoldIsNotWritten) {
  setPath("com.a", "1.0", "/1");
  const plist::Value version("1.0");
  client._setRestoreStatePropertyValue(plist::Value(), "path", "com.a", &version);
  EXPECT_EQ(path("com.a", "1.0"), plist::Value("/1"));
}

TEST_F(RestoreStateStore, AnUnreadableFileCountsAsAbsent) {
  setPath("com.a", "1.0", "/1");
  platform.files.failures.failAlways(FileOperation::readFile, kStore, Error::fromErrno(EIO));
  EXPECT_EQ(path("com.a", "1.0"), std::nullopt);
  client.cleanRestoreStateForIdentifier("com.a");
  EXPECT_TRUE(platform.files.has(kStore));
  setPath("com.b", "1.0", "/2");
  platform.files.failures.stopFailing();
  EXPECT_EQ(root(), plist::Value(plist::Dictionary{{"com.b", plist::Dictionary{{"1.0", pathOf("/2")}}}}));
}

TEST_F(RestoreStateStore, TheStoreOutlivesTheObject) {
  setPath("com.a", "1.0", "/1");
  takeClient().reset();
  EXPECT_EQ(makeClient()._restoreStatePropertyForKey("path", "com.a", std::make_unique<plist::Value>("1.0").get()),
            plist::Value("/1"));
}

TEST_F(RestoreStateStore, IdentifiersAndVersionsOfAnyTextAreKeptApart) {
  const std::string longText(65'536, 'v');
  for (const std::string& text : {std::string(), std::string(".."), std::string("/.."), longText})
    setPath(text, plist::Value(text), text.c_str());
  for (const std::string& text : {std::string(), std::string(".."), std::string("/.."), longText})
    EXPECT_EQ(path(text, plist::Value(text)), plist::Value(text));
}

TEST_F(RestoreStateStore, TransfersThatEndOnManyThreadsLoseNoPath) {
  constexpr std::size_t kThreads = 10;
  for (std::size_t thread = 0; thread < kThreads; ++thread)
    platform.backups.addRestoreData("com.app" + std::to_string(thread));
  runOnThreads(kThreads, [&](std::size_t thread) {
    const auto asset =
        std::make_shared<platform::ZTAsset>("com.app" + std::to_string(thread), "Application", std::nullopt);
    asset->setIsDownload(true);
    asset->setIsRestore(true);
    asset->setPath("package" + std::to_string(thread));
    asset->setVariantOptions(plist::Dictionary{{"Version", "1.0"}});
    client.assetTransferSucceeded(asset, true, std::nullopt);
  });
  for (std::size_t thread = 0; thread < kThreads; ++thread) {
    EXPECT_EQ(path("com.app" + std::to_string(thread), "1.0"),
              plist::Value("/var/mobile/Media/PublicStaging/package" + std::to_string(thread)));
  }
}

TEST_F(RestoreStateStore, FindsPropertyAtItsThreeLevels) {
  platform.files.put(kStore, binaryForm(plist::Dictionary{{"com.a", plist::Dictionary{{"1.0", pathOf("/p")}}}}));
  const RestoreState state(platform.files);
  const plist::Value version("1.0");
  const plist::Value number(1);
  ASSERT_NE(state.property("path", "com.a", &version), nullptr);
  EXPECT_EQ(*state.property("path", "com.a", &version), plist::Value("/p"));
  EXPECT_EQ(state.property("path", "com.a", nullptr), nullptr);
  EXPECT_EQ(state.property("path", "com.a", &number), nullptr);
  EXPECT_EQ(state.property("path", "com.b", &version), nullptr);
  EXPECT_EQ(state.property("size", "com.a", &version), nullptr);
}

TEST_F(RestoreStateStore, FindsNothingInMissingOrCorruptFile) {
  const plist::Value version("1.0");
  EXPECT_EQ(RestoreState(platform.files).property("path", "com.a", &version), nullptr);
  platform.files.put(kStore, "corrupt <");
  EXPECT_EQ(RestoreState(platform.files).property("path", "com.a", &version), nullptr);
}

}  // namespace appsync::test
