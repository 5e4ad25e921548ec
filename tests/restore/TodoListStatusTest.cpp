// How far each app has come, written into the host's todo list.
#include <cerrno>
#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "kit/fakes/Threads.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

class TodoListStatus : public ClientFixture {
 protected:
  AppsClient& client = makeClient();

  void putTodoList(plist::Array list) { putPropertyList(platform.files, kTodoListPath, std::move(list)); }
  std::optional<plist::Value> todoList() { return propertyListAt(platform.files, kTodoListPath); }
};

}  // namespace

TEST_F(TodoListStatus, AChangeIsLoggedAndWrittenBackAsABinaryList) {
  plist::Dictionary rich = installEntry("com.b", "2.0", "B");
  rich.set("extra", plist::Array{1, 2.5, true, plist::Value::data(bytesOf("data"))});
  putTodoList({installEntry("com.a"), rich, "stray"});
  logCalls(platform);
  client.changeAssetID("com.b", "SENT");
  EXPECT_TRUE(sameLines(
      LogLines{
          called("fileSystem.readFile /var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist"),
          logged("Changing com.b from install to SENT"),
          called(
              "fileSystem.writeFileAtomically /var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist"),
      },
      platform.log.lines()));
  rich.set("operation", "SENT");
  EXPECT_EQ(platform.files.contents(kTodoListPath), binaryForm(plist::Array{installEntry("com.a"), rich, "stray"}));
}

TEST_F(TodoListStatus, AnEntryMovesThroughItsWords) {
  putTodoList({installEntry("com.a")});
  for (const char* word : {"SENT", "DOWNLOADED", "INSTALLED", "FAILED"}) {
    client.changeAssetID("com.a", word);
    EXPECT_EQ(client._operationStateForIdentifier("com.a"), plist::Value(word));
  }
  EXPECT_TRUE(sameLines(
      LogLines{logged("Changing com.a from install to SENT"), logged("Changing com.a from SENT to DOWNLOADED"),
               logged("Changing com.a from DOWNLOADED to INSTALLED"),
               logged("Changing com.a from INSTALLED to FAILED")},
      platform.log.lines()));
}

TEST_F(TodoListStatus, OfTwoEntriesForOneAppOnlyTheFirstIsChangedAndReported) {
  putTodoList({installEntry("com.a"), removeEntry("com.a")});
  client.changeAssetID("com.a", "INSTALLED");
  EXPECT_EQ(todoList(), plist::Value(plist::Array{[] {
                                                    auto first = installEntry("com.a");
                                                    first.set("operation", "INSTALLED");
                                                    return first;
                                                  }(),
                                                  removeEntry("com.a")}));
  EXPECT_EQ(client._operationStateForIdentifier("com.a"), plist::Value("INSTALLED"));
}

TEST_F(TodoListStatus, AnAbsentAppLeavesTheFileByteForByteAndLogsNothing) {
  const Bytes before = xmlForm(plist::Array{installEntry("com.a")});
  platform.files.put(kTodoListPath, before);
  client.changeAssetID("com.b", "INSTALLED");
  EXPECT_EQ(platform.files.contents(kTodoListPath), before);
  EXPECT_EQ(platform.files.writes(kTodoListPath), 0U);
  EXPECT_TRUE(platform.log.lines().empty());
  EXPECT_EQ(client._operationStateForIdentifier("com.b"), std::nullopt);
}

TEST_F(TodoListStatus, WithoutATodoListNothingIsWrittenAndNothingReported) {
  client.changeAssetID("com.a", "INSTALLED");
  EXPECT_FALSE(platform.files.has(kTodoListPath));
  EXPECT_EQ(client._operationStateForIdentifier("com.a"), std::nullopt);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(TodoListStatus, AnEmptyTodoListIsNotRewritten) {
  putTodoList({});
  client.changeAssetID("com.a", "INSTALLED");
  EXPECT_EQ(platform.files.writes(kTodoListPath), 0U);
  EXPECT_EQ(client._operationStateForIdentifier("com.a"), std::nullopt);
}

TEST_F(TodoListStatus, AnUnparsableTodoListStaysAndIsLoggedAtEachAttempt) {
  platform.files.put(kTodoListPath, "<plist>");
  client.changeAssetID("com.a", "INSTALLED");
  EXPECT_EQ(client._operationStateForIdentifier("com.a"), std::nullopt);
  EXPECT_EQ(platform.files.text(kTodoListPath), "<plist>");
  EXPECT_TRUE(sameLines(LogLines{loggedError("couldn't parse todo list"), loggedError("couldn't parse todo list")},
                        platform.log.lines()));
}

TEST_F(TodoListStatus, ATodoListThatIsNoArrayStays) {
  putPropertyList(platform.files, kTodoListPath, installEntry("com.a"));
  client.changeAssetID("com.a", "INSTALLED");
  EXPECT_EQ(todoList(), plist::Value(installEntry("com.a")));
  EXPECT_TRUE(sameLines(LogLines{loggedError("todo list is not an array")}, platform.log.lines()));
}

TEST_F(TodoListStatus, AnEntryWithoutAWordGetsOneAndIsLoggedAsHavingNone) {
  putTodoList({plist::Dictionary{{"identifier", "com.a"}}});
  EXPECT_EQ(client._operationStateForIdentifier("com.a"), std::nullopt);
  client.changeAssetID("com.a", "SENT");
  EXPECT_TRUE(sameLines(LogLines{logged("Changing com.a from (null) to SENT")}, platform.log.lines()));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "SENT");
}

TEST_F(TodoListStatus, AWordThatIsNoStringIsReportedAsItIsAndReplaced) {
  putTodoList({plist::Dictionary{{"identifier", "com.a"}, {"operation", 7}}});
  EXPECT_EQ(client._operationStateForIdentifier("com.a"), plist::Value(7));
  client.changeAssetID("com.a", "SENT");
  EXPECT_TRUE(sameLines(LogLines{logged("Changing com.a from 7 to SENT")}, platform.log.lines()));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "SENT");
}

TEST_F(TodoListStatus, EntriesThatAreNoDictionariesOrHaveOddIdentifiersArePassedOverAndKept) {
  const plist::Array odd{"com.a", 7, plist::Array{installEntry("com.a")}, plist::Dictionary{{"identifier", 7}},
                         plist::Dictionary{{"identifier", plist::Value::data(bytesOf("com.a"))}}};
  plist::Array list = odd;
  list.emplace_back(entry("com.a", "install"));
  putTodoList(list);
  client.changeAssetID("com.a", "SENT");
  list.back() = entry("com.a", "SENT");
  EXPECT_EQ(todoList(), plist::Value(list));
}

TEST_F(TodoListStatus, IdentifiersAreComparedExactly) {
  putTodoList({installEntry("com.A"), installEntry("com.a "), installEntry("")});
  client.changeAssetID("com.a", "SENT");
  EXPECT_EQ(platform.files.writes(kTodoListPath), 0U);
  client.changeAssetID("", "SENT");
  EXPECT_EQ(operationWord(platform.files, ""), "SENT");
}

TEST_F(TodoListStatus, AListThatCannotBeWrittenStaysAsItWas) {
  const Bytes before = xmlForm(plist::Array{installEntry("com.a")});
  platform.files.put(kTodoListPath, before);
  platform.files.failures.failNext(FileOperation::writeFileAtomically, kTodoListPath, Error::fromErrno(ENOSPC));
  client.changeAssetID("com.a", "SENT");
  EXPECT_EQ(platform.files.contents(kTodoListPath), before);
  EXPECT_TRUE(sameLines(LogLines{logged("Changing com.a from install to SENT")}, platform.log.lines()));
}

TEST_F(TodoListStatus, AReportOfAWordWritesNothing) {
  putTodoList({installEntry("com.a")});
  EXPECT_EQ(client._operationStateForIdentifier("com.a"), plist::Value("install"));
  EXPECT_EQ(platform.files.writes(kTodoListPath), 0U);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(TodoListStatus, TenThreadsOfInstallOutcomesLoseNoWord) {
  constexpr std::size_t kThreads = 10;
  constexpr std::size_t kAppsPerThread = 10;
  const auto identifierOf = [](std::size_t thread, std::size_t app) {
    return "com.app" + std::to_string(thread) + "." + std::to_string(app);
  };
  plist::Array list;
  for (std::size_t thread = 0; thread < kThreads; ++thread) {
    for (std::size_t app = 0; app < kAppsPerThread; ++app)
      list.emplace_back(installEntry(identifierOf(thread, app)));
  }
  putTodoList(list);
  runOnThreads(kThreads, [&](std::size_t thread) {
    for (std::size_t app = 0; app < kAppsPerThread; ++app) {
      const platform::ZTAsset asset(identifierOf(thread, app), "Application", std::nullopt);
      if (app % 2 == 0) {
        client.assetInstallSucceeded(asset);
      } else {
        client.assetInstallFailed(asset, Error{"InstallerError", 1, "bad", {}});
      }
    }
  });
  for (std::size_t thread = 0; thread < kThreads; ++thread) {
    for (std::size_t app = 0; app < kAppsPerThread; ++app)
      EXPECT_EQ(operationWord(platform.files, identifierOf(thread, app)), app % 2 == 0 ? "INSTALLED" : "FAILED");
  }
}

TEST_F(TodoListStatus, TransfersThatEndOnManyThreadsLoseNoWord) {
  plist::Array list;
  for (int app = 0; app < 10; ++app)
    list.emplace_back(installEntry("com.app" + std::to_string(app)));
  putTodoList(list);
  runOnThreads(10, [&](std::size_t thread) {
    const auto asset =
        std::make_shared<platform::ZTAsset>("com.app" + std::to_string(thread), "Application", std::nullopt);
    asset->setPath("package");
    client.assetTransferUpdatedProgress(asset, 0.5);
    client.assetTransferSucceeded(asset, true, std::nullopt);  // Not a download: only the word changes.
  });
  for (int app = 0; app < 10; ++app)
    EXPECT_EQ(operationWord(platform.files, "com.app" + std::to_string(app)), "SENT");
}

}  // namespace appsync::test
