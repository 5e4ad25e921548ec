// The report of the apps that are gone.
#include <initializer_list>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

constexpr std::string_view kLastSyncState = "/var/mobile/Library/ApplicationSync/LastSyncAppState.plist";

plist::Dictionary reportOf(std::initializer_list<const char*> identifiers) {
  plist::Array deleted;
  for (const char* identifier : identifiers)
    deleted.emplace_back(plist::Dictionary{{"BundleIdentifier", identifier}});
  return {{"_Deleted", deleted}};
}

class InstalledAssets : public ClientFixture {
 protected:
  AppsClient& client = makeClient();

  void putTodoList(plist::Array list) { putPropertyList(platform.files, kTodoListPath, std::move(list)); }
  void putLastSyncState(plist::Array list) { putPropertyList(platform.files, kLastSyncState, std::move(list)); }
};

}  // namespace

TEST_F(InstalledAssets, WithoutListsAndUninstalledAppsTheReportIsEmpty) {
  EXPECT_EQ(client.installedAssets(), reportOf({}));
}

TEST_F(InstalledAssets, EveryStepIsLoggedInOrder) {
  putTodoList({entry("com.failed", "FAILED"), entry("com.pending", "install"), entry("com.done", "INSTALLED")});
  putLastSyncState({"com.kept", "com.lost"});
  for (const char* identifier : {"com.failed", "com.pending", "com.done", "com.unknown"})
    platform.uninstalledList.add(identifier);
  platform.registry.add(FakeApp::installed("com.kept"));
  logCalls(platform);

  EXPECT_EQ(client.installedAssets(), reportOf({"com.done", "com.failed", "com.unknown", "com.lost"}));
  EXPECT_TRUE(sameLines(
      LogLines{
          logged("getting installed assets"),
          called("fileSystem.readFile /var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist"),
          called("fileSystem.readFile /var/mobile/Library/ApplicationSync/LastSyncAppState.plist"),
          called("uninstalledApps.lookupUninstalled"),
          called("registry.applicationIsInstalled com.kept"),
          called("registry.applicationIsInstalled com.lost"),
          logged("com.done not installed, and no todo (found=1 pi=1 failed=0) Marking as deleted"),
          logged("com.failed not installed, and no todo (found=1 pi=0 failed=1) Marking as deleted"),
          logged("com.pending not installed, but is in our todo list. Not marking deleted"),
          logged("com.unknown not installed, and no todo (found=0 pi=0 failed=0) Marking as deleted"),
          logged("com.lost not installed, and no todo (found=0 pi=0 failed=0) Marking as deleted"),
          loggedIn(14,
                   "finished getting installed assets toDoList:({identifier = com.failed; operation = FAILED;}, "
                   "{identifier = com.pending; operation = install;}, "
                   "{identifier = com.done; operation = INSTALLED;}), "
                   "uninstalled apps (com.done, com.failed, com.pending, com.unknown), "
                   "last synced apps(com.kept, com.lost)"),
      },
      platform.log.lines()));
}

TEST_F(InstalledAssets, AbsentListsArePrintedAsAbsent) {
  platform.uninstalledList.loseAnswers();
  EXPECT_EQ(client.installedAssets(), reportOf({}));
  EXPECT_TRUE(
      sameLines(LogLines{logged("getting installed assets"), loggedError("InstavorLookupUninstalled returned NULL"),
                         loggedIn(14,
                                  "finished getting installed assets toDoList:(null), uninstalled apps (null), last "
                                  "synced apps(null)")},
                platform.log.lines()));
}

TEST_F(InstalledAssets, AnUninstalledAppThatTheHostWantsToInstallIsNotReported) {
  putTodoList({installEntry("com.a")});
  platform.uninstalledList.add("com.a");
  EXPECT_EQ(client.installedAssets(), reportOf({}));
}

TEST_F(InstalledAssets, AnUninstalledAppWithAnyPendingWordIsNotReported) {
  putTodoList({entry("com.a", "remove"), entry("com.b", "SENT"), entry("com.c", "DOWNLOADED"), entry("com.d", "failed"),
               entry("com.e", "")});
  for (const char* identifier : {"com.a", "com.b", "com.c", "com.d", "com.e"})
    platform.uninstalledList.add(identifier);
  EXPECT_EQ(client.installedAssets(), reportOf({}));
}

TEST_F(InstalledAssets, AnUninstalledAppWhoseEntryHasNoWordIsNotReported) {
  putTodoList(
      {plist::Dictionary{{"identifier", "com.a"}}, plist::Dictionary{{"identifier", "com.b"}, {"operation", 5}}});
  platform.uninstalledList.add("com.a");
  platform.uninstalledList.add("com.b");
  EXPECT_EQ(client.installedAssets(), reportOf({}));
}

TEST_F(InstalledAssets, AnUninstalledAppWhoseInstallFailedIsReported) {
  putTodoList({entry("com.a", "FAILED")});
  platform.uninstalledList.add("com.a");
  EXPECT_EQ(client.installedAssets(), reportOf({"com.a"}));
}

TEST_F(InstalledAssets, AnUninstalledAppThatHadBeenInstalledIsReported) {
  putTodoList({entry("com.a", "INSTALLED")});
  platform.uninstalledList.add("com.a");
  EXPECT_EQ(client.installedAssets(), reportOf({"com.a"}));
}

TEST_F(InstalledAssets, AnAppOfTheLastSyncThatIsStillInstalledIsNotReported) {
  putLastSyncState({"com.a"});
  platform.registry.add(FakeApp::installed("com.a"));
  EXPECT_EQ(client.installedAssets(), reportOf({}));
}

TEST_F(InstalledAssets, AnAppOfTheLastSyncThatIsAPlaceholderIsNotReported) {
  putLastSyncState({"com.a"});
  platform.registry.add(FakeApp::placeholder("com.a"));
  EXPECT_EQ(client.installedAssets(), reportOf({}));
}

TEST_F(InstalledAssets, AnAppOfTheLastSyncThatIsGoneIsReported) {
  putLastSyncState({"com.a"});
  EXPECT_EQ(client.installedAssets(), reportOf({"com.a"}));
}

TEST_F(InstalledAssets, AnAppOfBothListsIsReportedOnce) {
  putLastSyncState({"com.a", "com.a"});
  platform.uninstalledList.add("com.a");
  EXPECT_EQ(client.installedAssets(), reportOf({"com.a"}));
}

TEST_F(InstalledAssets, OfTwoEntriesForOneAppTheFirstDecides) {
  putTodoList(
      {entry("com.a", "install"), entry("com.a", "FAILED"), entry("com.b", "FAILED"), entry("com.b", "install")});
  platform.uninstalledList.add("com.a");
  platform.uninstalledList.add("com.b");
  EXPECT_EQ(client.installedAssets(), reportOf({"com.b"}));
}

TEST_F(InstalledAssets, IdentifiersAreComparedExactly) {
  putTodoList({entry("com.A", "install"), entry("com.a ", "install")});
  platform.uninstalledList.add("com.a");
  EXPECT_EQ(client.installedAssets(), reportOf({"com.a"}));
}

TEST_F(InstalledAssets, AReportedAppIsRememberedEvenWhenItIsNotMarkedDeleted) {
  putTodoList({installEntry("com.a")});
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(platform.journal.contains("uninstalledApps.clearUninstalled com.a"));
}

TEST_F(InstalledAssets, ALostAnswerKeepsTheOldListAndStillLooksAtTheLastSync) {
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  platform.uninstalledList.loseAnswers();
  putLastSyncState({"com.lost"});
  platform.log.clear();
  EXPECT_EQ(client.installedAssets(), reportOf({"com.lost"}));
  EXPECT_TRUE(platform.log.contains(loggedError("InstavorLookupUninstalled returned NULL")));
  EXPECT_TRUE(platform.log.contains(
      loggedIn(14,
               "finished getting installed assets toDoList:(null), uninstalled apps (com.a), last synced "
               "apps(com.lost)")));
}

TEST_F(InstalledAssets, ANewAnswerReplacesTheOldList) {
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  platform.uninstalledList.remove("com.a");
  static_cast<void>(client.installedAssets());
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(platform.journal.contains("uninstalledApps.clearUninstalled"));
}

TEST_F(InstalledAssets, MalformedListsCountAsAbsent) {
  platform.files.put(kTodoListPath, "<plist><array>");
  putPropertyList(platform.files, kLastSyncState, plist::Dictionary{{"com.a", "com.a"}});
  platform.uninstalledList.add("com.b");
  EXPECT_EQ(client.installedAssets(), reportOf({"com.b"}));
  EXPECT_TRUE(platform.log.contains(loggedError("couldn't parse todo list")));
  EXPECT_TRUE(platform.log.contains(loggedError("todo list is not an array")));
}

TEST_F(InstalledAssets, ElementsOfTheLastSyncThatAreNoIdentifiersArePassedOver) {
  putLastSyncState({7, true, plist::Array{"com.a"}, plist::Dictionary{{"identifier", "com.a"}}, "com.b"});
  EXPECT_EQ(client.installedAssets(), reportOf({"com.b"}));
  EXPECT_EQ(platform.journal.count("registry.applicationIsInstalled"), 1U);
}

TEST_F(InstalledAssets, EntriesThatAreNoDictionariesArePassedOver) {
  putTodoList({"com.a", 7, plist::Array{entry("com.a", "install")}, plist::Dictionary{{"identifier", 7}},
               plist::Dictionary{}, entry("com.a", "FAILED")});
  platform.uninstalledList.add("com.a");
  EXPECT_EQ(client.installedAssets(), reportOf({"com.a"}));
}

TEST_F(InstalledAssets, TheFilesAreLeftAsTheyAre) {
  putTodoList({installEntry("com.a")});
  putLastSyncState({"com.a"});
  const auto before = platform.files.paths();
  static_cast<void>(client.installedAssets());
  EXPECT_EQ(platform.files.paths(), before);
  EXPECT_EQ(platform.files.writes(kTodoListPath) + platform.files.writes(kLastSyncState), 0U);
}

TEST_F(InstalledAssets, LongListsAreMatchedInTimeProportionalToTheirLengths) {
  constexpr int kEntries = 100'000;
  plist::Array list;
  for (int number = 0; number < kEntries; ++number)
    list.emplace_back(entry("com.app" + std::to_string(number), number % 2 == 0 ? "install" : "FAILED"));
  platform.files.put(kTodoListPath, binaryForm(list));
  for (int number = 0; number < kEntries; number += 5)
    platform.uninstalledList.add("com.app" + std::to_string(number));
  const plist::Dictionary report = client.installedAssets();
  EXPECT_EQ(report.find("_Deleted")->array()->size(), 10'000U);
}

}  // namespace appsync::test
