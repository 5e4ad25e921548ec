// Taking the host's staging folder over and removing apps.
#include <cerrno>
#include <initializer_list>
#include <memory>
#include <optional>
#include <stdexcept>
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

constexpr std::string_view kStaging = "/var/mobile/Media/PublicStaging/ApplicationSync";
constexpr std::string_view kSyncFolder = "/var/mobile/Library/ApplicationSync";
constexpr std::string_view kWorkArea = "/var/mobile/Library/ApplicationSync/HarvoStuff";
constexpr std::string_view kDebugCopy =
    "/var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist-debug.plist";
constexpr std::string_view kStagedIconState = "/var/mobile/Media/PublicStaging/ApplicationSync/SolvaryIconState.plist";
constexpr std::string_view kNotification = "com.corvel.solvary.zeph.wsyncnotify";

class ReconcileSync : public ClientFixture {
 protected:
  AppsClient& client = makeClient();
  std::optional<Error> error;

  void stage(plist::Array todoList) { putPropertyList(platform.files, kStagedTodoListPath, std::move(todoList)); }
  bool reconcile() { return client.reconcileSync({}, "anchor", nullptr, &error); }
  void install(std::initializer_list<const char*> identifiers) {
    for (const char* identifier : identifiers)
      platform.registry.add(FakeApp::installed(identifier));
  }
  [[nodiscard]] std::vector<std::string> uninstalled() const {
    std::vector<std::string> identifiers;
    for (const auto& uninstall : platform.registry.uninstalls())
      identifiers.push_back(uninstall.identifier);
    return identifiers;
  }
};

}  // namespace

TEST_F(ReconcileSync, EveryStepIsTakenInOrder) {
  stage({removeEntry("com.a"), installEntry("com.new"), removeEntry("com.missing")});
  platform.files.put(kStagedIconState, "icons");
  platform.files.put(std::string(kWorkArea) + "/old", "old");
  install({"com.a"});
  logCalls(platform);

  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(error);
  EXPECT_TRUE(sameLines(
      LogLines{
          logged("starting to reconcile sync with new anchor anchor"),
          called("fileSystem.removeItem /var/mobile/Library/ApplicationSync/HarvoStuff"),
          called("fileSystem.createDirectory /var/mobile/Library/ApplicationSync"),
          called("fileSystem.fileExists /var/mobile/Media/PublicStaging/ApplicationSync"),
          called("fileSystem.attributesOfItem /var/mobile/Media/PublicStaging/ApplicationSync"),
          called("fileSystem.moveItem /var/mobile/Media/PublicStaging/ApplicationSync "
                 "/var/mobile/Library/ApplicationSync/HarvoStuff"),
          called("profileConnection.effectiveBoolValueForSetting appRemovalAllowed"),
          called("fileSystem.readFile /var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist"),
          logged("com.a targeted for termination"),
          logged("com.missing targeted for termination"),
          logged("performing 2 deletions"),
          called("registry.uninstallApplication com.a"),
          called("transactionLog.logScenario Harvo Sync com.a y Uninstall succeeded"),
          called("registry.uninstallApplication com.missing"),
          loggedError("Uninstall of com.missing failed."),
          called("transactionLog.logScenario Harvo Sync com.missing n Uninstall failed"),
          called("systemNotify.registerCheck com.corvel.solvary.zeph.wsyncnotify"),
          logged("Notifying SV we are starting syncing"),
          called("homeScreen.blockableServerPort"),
          called("systemNotify.setState com.corvel.solvary.zeph.wsyncnotify 1"),
          called("systemNotify.post com.corvel.solvary.zeph.wsyncnotify"),
          called("fileSystem.readFile /var/mobile/Library/ApplicationSync/HarvoStuff/SolvaryIconState.plist"),
          logged("Sending iconlayout to SV"),
          called("homeScreen.blockableServerPort"),
          called("homeScreen.setIconState"),
          called("fileSystem.writeFileAtomically "
                 "/var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist-debug.plist"),
          logged("finished reconcile sync"),
      },
      platform.log.lines()));
}

TEST_F(ReconcileSync, WithoutAStagingFolderThereIsNothingToDo) {
  platform.files.put(std::string(kWorkArea) + "/ApplicationsSync.plist", "old");
  logCalls(platform);
  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(error);
  EXPECT_TRUE(sameLines(
      LogLines{
          logged("starting to reconcile sync with new anchor anchor"),
          called("fileSystem.removeItem /var/mobile/Library/ApplicationSync/HarvoStuff"),
          called("fileSystem.createDirectory /var/mobile/Library/ApplicationSync"),
          called("fileSystem.fileExists /var/mobile/Media/PublicStaging/ApplicationSync"),
          logged("Nothing to do"),
          logged("finished reconcile sync"),
      },
      platform.log.lines()));
  EXPECT_FALSE(platform.files.has(kWorkArea));
  EXPECT_TRUE(platform.notify.posts().empty());
  EXPECT_TRUE(platform.screen.iconStates().empty());
}

TEST_F(ReconcileSync, TheSyncFolderIsMadeWithItsParents) {
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(platform.files.hasFolder(kSyncFolder));
  EXPECT_EQ(platform.files.owners(kSyncFolder), platform::OwnerAttributes{});
}

TEST_F(ReconcileSync, TheStagingFolderBecomesTheWorkArea) {
  stage({});
  platform.files.put(std::string(kStaging) + "/Packages/a", "package");
  platform.files.put(std::string(kWorkArea) + "/old", "old");
  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(platform.files.has(kStaging));
  EXPECT_EQ(platform.files.text(std::string(kWorkArea) + "/Packages/a"), "package");
  EXPECT_FALSE(platform.files.has(std::string(kWorkArea) + "/old"));
}

/// Otherwise the list that is being written would replace the new one. Waiting for the queue from its own work is
/// reported.
TEST_F(ReconcileSync, TheStagingFolderIsNotTakenOverWhileTheTodoListIsBeingChanged) {
  putPropertyList(platform.files, kTodoListPath, plist::Array{installEntry("com.old")});
  stage({installEntry("com.new")});
  bool isReported = false;
  platform.journal.setHook([&](std::string_view operation, std::string_view) -> std::optional<Error> {
    if (operation != "fileSystem.writeFileAtomically" || isReported) return std::nullopt;
    try {
      reconcile();
    } catch (const std::logic_error&) {
      isReported = true;
    }
    return std::nullopt;
  });
  client.assetInstallSucceeded(*platform.framework.downloadAssetWithIdentifier("com.old", "Application", "Old"));
  platform.journal.setHook(nullptr);
  EXPECT_TRUE(isReported);
  EXPECT_TRUE(platform.files.has(kStagedTodoListPath));
}

TEST_F(ReconcileSync, FailureToMakeTheSyncFolderFailsTheSync) {
  stage({removeEntry("com.a")});
  const Error full = Error::fromErrno(ENOSPC, kSyncFolder);
  platform.files.failures.failNext(FileOperation::createDirectory, kSyncFolder, full);
  EXPECT_FALSE(reconcile());
  EXPECT_EQ(error, full);
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("can't create work area"), logged("finished reconcile sync")},
                        platform.log.lines()));
  EXPECT_TRUE(platform.files.has(kStaging));
  EXPECT_TRUE(platform.notify.posts().empty());
}

TEST_F(ReconcileSync, FailureToMoveTheStagingFolderFailsTheSync) {
  stage({removeEntry("com.a")});
  const Error busy = Error::fromErrno(EBUSY, kStaging);
  platform.files.failures.failNext(FileOperation::moveItem, kStaging, busy);
  EXPECT_FALSE(reconcile());
  EXPECT_EQ(error, busy);
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("Can't move staging area"), logged("finished reconcile sync")},
                        platform.log.lines()));
  EXPECT_TRUE(platform.files.has(kStagedTodoListPath));
  EXPECT_TRUE(platform.notify.posts().empty());
  EXPECT_TRUE(uninstalled().empty());
}

TEST_F(ReconcileSync, AWorkAreaThatCannotBeRemovedOnlyShowsWhenTheStagingFolderCannotBeMoved) {
  stage({});
  platform.files.put(std::string(kWorkArea) + "/old", "old");
  platform.files.failures.failNext(FileOperation::removeItem, kWorkArea, Error::fromErrno(EBUSY, kWorkArea));
  EXPECT_FALSE(reconcile());
  ASSERT_TRUE(error);
  EXPECT_EQ(error->code, EEXIST);
  EXPECT_TRUE(platform.log.contains(logged("Can't move staging area")));
}

TEST_F(ReconcileSync, TheErrorSlotMayBeAbsent) {
  stage({});
  platform.files.failures.failNext(FileOperation::createDirectory, kSyncFolder, Error::fromErrno(ENOSPC));
  EXPECT_FALSE(client.reconcileSync({}, "anchor", nullptr, nullptr));
  platform.files.failures.failNext(FileOperation::moveItem, kStaging, Error::fromErrno(EBUSY));
  EXPECT_FALSE(client.reconcileSync({}, "anchor", nullptr, nullptr));
}

TEST_F(ReconcileSync, AssetsAndProgressCallbackAreNotUsed) {
  stage({});
  bool hasProgressed = false;
  const auto asset = std::make_shared<platform::ZTAsset>("com.a", "Application", std::nullopt);
  EXPECT_TRUE(client.reconcileSync(
      {asset, nullptr}, "", [&](double) { hasProgressed = true; }, nullptr));
  EXPECT_FALSE(hasProgressed);
  EXPECT_EQ(asset.use_count(), 1);
}

TEST_F(ReconcileSync, WithoutATodoListTheHomeScreenStillHearsOfTheSync) {
  platform.files.put(kStagedIconState, "icons");
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(error) << "what the read reported, although the result is true";
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("Nothing to do from Harvo"), logged("Notifying SV we are starting syncing"),
                                 logged("Sending iconlayout to SV"), logged("finished reconcile sync")},
                        platform.log.lines()));
  EXPECT_EQ(platform.notify.posts(), (std::vector<Post>{{std::string(kNotification), 1}}));
  EXPECT_FALSE(platform.files.has(kDebugCopy));
}

TEST_F(ReconcileSync, AnEmptyTodoFileIsNothingToDoWithoutAnError) {
  platform.files.put(kStagedTodoListPath, "");
  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(error);
  EXPECT_TRUE(platform.log.contains(logged("Nothing to do from Harvo")));
  EXPECT_FALSE(platform.files.has(kDebugCopy));
}

TEST_F(ReconcileSync, AnUnparsableTodoListIsNothingToDo) {
  platform.files.put(kStagedTodoListPath, "<plist>");
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 loggedError("couldn't parse todo list"), logged("Nothing to do from Harvo"),
                                 logged("Notifying SV we are starting syncing"), logged("finished reconcile sync")},
                        platform.log.lines()));
  EXPECT_FALSE(platform.files.has(kDebugCopy));
}

TEST_F(ReconcileSync, ATodoListThatIsNoArrayIsNothingToDo) {
  putPropertyList(platform.files, kStagedTodoListPath, removeEntry("com.a"));
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(platform.log.contains(loggedError("todo list is not an array")));
  EXPECT_TRUE(platform.log.contains(logged("Nothing to do from Harvo")));
  EXPECT_TRUE(uninstalled().empty());
}

TEST_F(ReconcileSync, AnEmptyTodoListRemovesNothingSilently) {
  stage({});
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("Notifying SV we are starting syncing"), logged("finished reconcile sync")},
                        platform.log.lines()));
}

TEST_F(ReconcileSync, OnlyRemoveEntriesAreRemovedInTheirOrder) {
  install({"com.a", "com.b", "com.c", "com.d"});
  stage({removeEntry("com.d"), installEntry("com.a"), entry("com.b", "REMOVE"), removeEntry("com.c"),
         entry("com.b", "launch"), plist::Dictionary{{"identifier", "com.b"}}});
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(uninstalled(), (std::vector<std::string>{"com.d", "com.c"}));
  EXPECT_EQ(platform.registry.uninstalls()[0].options, plist::Dictionary());
}

TEST_F(ReconcileSync, AnIdentifierWithASlashAndTwoDotsIsNotRemoved) {
  stage({removeEntry("com.a/../com.b"), removeEntry("/..")});
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(uninstalled().empty());
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("Notifying SV we are starting syncing"), logged("finished reconcile sync")},
                        platform.log.lines()));
}

TEST_F(ReconcileSync, AnAppThatIsNamedTwiceIsRemovedTwice) {
  install({"com.a"});
  stage({removeEntry("com.a"), removeEntry("com.a")});
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(platform.transactions.scenarios(),
            (std::vector<ScenarioEntry>{{"Harvo Sync", Success::yes, "com.a", "Uninstall succeeded"},
                                        {"Harvo Sync", Success::no, "com.a", "Uninstall failed"}}));
}

TEST_F(ReconcileSync, AFailedRemovalStopsNeitherTheOthersNorTheSync) {
  install({"com.a", "com.b", "com.c"});
  stage({removeEntry("com.a"), removeEntry("com.b"), removeEntry("com.c")});
  platform.registry.failures.failNext(RegistryOperation::uninstallApplication, "com.b",
                                      Error{"InstallerError", 3, "busy", {}});
  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(error);
  EXPECT_EQ(platform.registry.identifiers(), std::vector<std::string>{"com.b"});
  EXPECT_EQ(platform.transactions.scenarios(),
            (std::vector<ScenarioEntry>{{"Harvo Sync", Success::yes, "com.a", "Uninstall succeeded"},
                                        {"Harvo Sync", Success::no, "com.b", "Uninstall failed"},
                                        {"Harvo Sync", Success::yes, "com.c", "Uninstall succeeded"}}));
  EXPECT_TRUE(platform.log.contains(loggedError("Uninstall of com.b failed.")));
}

TEST_F(ReconcileSync, RestrictedRemovalRemovesNothingAndGoesOn) {
  platform.restrictions.set(platform::RestrictionSetting::appRemovalAllowed, platform::RestrictionValue::no);
  install({"com.a", "com.b"});
  stage({removeEntry("com.a"), removeEntry("com.b")});
  platform.files.put(kStagedIconState, "icons");
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("Not processing deletes because app removal is restricted"),
                                 logged("Notifying SV we are starting syncing"), logged("Sending iconlayout to SV"),
                                 logged("finished reconcile sync")},
                        platform.log.lines()));
  EXPECT_TRUE(uninstalled().empty());
  EXPECT_EQ(platform.notify.posts(), (std::vector<Post>{{std::string(kNotification), 1}}));
  EXPECT_EQ(platform.screen.iconStates(), std::vector<std::string>{"icons"});
  EXPECT_TRUE(platform.files.has(kDebugCopy));
}

TEST_F(ReconcileSync, TheRestrictionIsAskedForOnceForAllRemovals) {
  stage({removeEntry("com.a"), removeEntry("com.b"), removeEntry("com.c")});
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(platform.journal.count("profileConnection."), 1U);
}

TEST_F(ReconcileSync, TheIconLayoutIsHandedOverByteForByte) {
  stage({});
  const std::string layout("\x00\xff not a list \n", 16);
  platform.files.put(kStagedIconState, layout);
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(platform.screen.iconStates(), std::vector<std::string>{layout});
}

TEST_F(ReconcileSync, AnEmptyIconStateFileIsNotSent) {
  stage({});
  platform.files.put(kStagedIconState, "");
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(platform.screen.iconStates().empty());
  EXPECT_FALSE(platform.log.contains(logged("Sending iconlayout to SV")));
}

TEST_F(ReconcileSync, TheDebugCopyIsABinaryCopyOfTheWholeList) {
  plist::Dictionary rich = installEntry("com.a");
  rich.set("extra", plist::Array{1, true, plist::Dictionary{{"deep", "down"}}});
  stage({rich, "stray", removeEntry("com.b")});
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(platform.files.contents(kDebugCopy), binaryForm(plist::Array{rich, "stray", removeEntry("com.b")}));
  EXPECT_EQ(platform.files.contents(kTodoListPath), xmlForm(plist::Array{rich, "stray", removeEntry("com.b")}));
}

TEST_F(ReconcileSync, TheDebugCopyIsWrittenWhenNoEntryWasActedOn) {
  stage({installEntry("com.a")});
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(platform.files.contents(kDebugCopy), binaryForm(plist::Array{installEntry("com.a")}));
}

TEST_F(ReconcileSync, ADebugCopyThatCannotBeWrittenIsNoFailure) {
  stage({installEntry("com.a")});
  platform.files.failures.failNext(FileOperation::writeFileAtomically, kDebugCopy, Error::fromErrno(ENOSPC));
  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(error);
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("Notifying SV we are starting syncing"), logged("finished reconcile sync")},
                        platform.log.lines()));
}

TEST_F(ReconcileSync, AFailedNotificationDoesNotStopTheSync) {
  stage({});
  platform.files.put(kStagedIconState, "icons");
  platform.notify.failRegistrationsWith(3);
  EXPECT_TRUE(reconcile());
  EXPECT_TRUE(platform.log.contains(loggedError("Uh Oh...can't send notification to SV:3")));
  EXPECT_EQ(platform.screen.iconStates(), std::vector<std::string>{"icons"});
}

TEST_F(ReconcileSync, ASecondSyncReplacesTheFirstOnesWorkArea) {
  stage({installEntry("com.a")});
  EXPECT_TRUE(reconcile());
  stage({installEntry("com.b")});
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(propertyListAt(platform.files, kTodoListPath), plist::Value(plist::Array{installEntry("com.b")}));
}

}  // namespace appsync::test
