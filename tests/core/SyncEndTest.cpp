// The ends: of the transfers, and of the sync.
#include <cerrno>
#include <chrono>
#include <memory>
#include <optional>
#include <set>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/SyncFileBuilder.h"
#include "kit/fakes/TextDiff.h"
#include "kit/fakes/Threads.h"
#include "tests/core/SyncEndFixture.h"

namespace appsync::test {

namespace {

using platform::TSInstallState;
using platform::ZTAsset;

constexpr std::string_view kNotification = "com.corvel.solvary.zeph.wsyncnotify";

class TransferEnd : public SyncEndFixture {};
class SyncEnd : public SyncEndFixture {};

}  // namespace

TEST_F(TransferEnd, WithNothingOutstandingTheHomeScreenHearsThatTheSyncIsDone) {
  startTrace();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(sameLines(LogLines{logged("asset transfer ended withsuccess: y"),
                                 called("systemNotify.registerCheck com.corvel.solvary.zeph.wsyncnotify"),
                                 logged("Notifying SV we are done syncing"), called("homeScreen.blockableServerPort"),
                                 called("systemNotify.setState com.corvel.solvary.zeph.wsyncnotify 0"),
                                 called("systemNotify.post com.corvel.solvary.zeph.wsyncnotify")},
                        platform.log.lines()));
}

TEST_F(TransferEnd, AFailedEndIsLoggedAsOne) {
  client.assetTransferEndedWithSuccess(false);
  EXPECT_TRUE(
      sameLines(LogLines{logged("asset transfer ended withsuccess: n"), logged("Notifying SV we are done syncing")},
                platform.log.lines()));
}

TEST_F(TransferEnd, EveryStepIsTakenInOrder) {
  attemptInstall();
  beginTransfer("com.a");
  beginTransfer("com.b");
  startTrace();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(sameLines(
      LogLines{
          logged("asset transfer ended withsuccess: y"),
          called("systemNotify.registerCheck com.corvel.solvary.zeph.wsyncnotify"),
          logged("Notifying SV we are done syncing"),
          called("homeScreen.blockableServerPort"),
          called("systemNotify.setState com.corvel.solvary.zeph.wsyncnotify 0"),
          called("systemNotify.post com.corvel.solvary.zeph.wsyncnotify"),
          called("softwareLibrary.make"),
          called("softwareLibrary.refreshReceipts"),
          logged("refreshReceiptsWithCompletionBlock succeeded"),
          logged("Setting state for outstanding DCX loading phase of asset com.a to TSInstallStateFinished"),
          called("registry.recordForIdentifier com.a or placeholder"),
          called("registry.installProgressForApplication com.a 0"),
          loggedError("Returning progress of com.a progress for com.a"),
          called("progress.setInstallState 5 com.a"),
          called("registry.installPhaseFinishedForProgress com.a"),
          logged("Setting state for outstanding DCX loading phase of asset com.b to TSInstallStateFinished"),
          called("registry.recordForIdentifier com.b or placeholder"),
          called("registry.installProgressForApplication com.b 0"),
          loggedError("Returning progress of com.b progress for com.b"),
          called("progress.setInstallState 5 com.b"),
          called("registry.installPhaseFinishedForProgress com.b"),
          loggedError("Called with success == YES but with 2 outstanding DCX transfers!"),
      },
      platform.log.lines()));
}

TEST_F(TransferEnd, ReceiptsAreRefreshedBeforeTheLibraryIsReleased) {
  attemptInstall();
  platform.journal.clear();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(sameLines({"softwareLibrary.make", "softwareLibrary.refreshReceipts", "softwareLibrary.release"},
                        platform.journal.lines({"softwareLibrary."})));
}

TEST_F(TransferEnd, WithoutAnAttemptedInstallNoReceiptsAreRefreshed) {
  beginTransfer("com.a");
  client.assetTransferEndedWithSuccess(false);
  EXPECT_EQ(platform.journal.count("softwareLibrary."), 0U);
}

TEST_F(TransferEnd, ReceiptsAreRefreshedAfterAFailedInstallToo) {
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.attempted",
                                      Error{"InstallerError", 1, "bad package", {}});
  attemptInstall();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(platform.journal.count("softwareLibrary.refreshReceipts"), 1U);
}

TEST_F(TransferEnd, ReceiptsAreRefreshedOnceForAllInstallsOfASync) {
  attemptInstall();
  attemptInstall();
  client.assetTransferEndedWithSuccess(true);
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(platform.journal.count("softwareLibrary.refreshReceipts"), 1U);
}

TEST_F(TransferEnd, AFailedRefreshIsLogged) {
  platform.store.completeRefreshes(RefreshCompletion::beforeReturn, Error{"StoreError", 7, "no network", {}});
  attemptInstall();
  platform.log.clear();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(
      sameLines(LogLines{logged("asset transfer ended withsuccess: y"), logged("Notifying SV we are done syncing"),
                         logged("refreshReceiptsWithCompletionBlock failed: StoreError 7 \"no network\"")},
                platform.log.lines()));
}

TEST_F(TransferEnd, ARefreshThatCompletesOnAnotherThreadIsWaitedFor) {
  platform.store.completeRefreshes(RefreshCompletion::onOwnThread);
  attemptInstall();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(platform.log.contains(logged("refreshReceiptsWithCompletionBlock succeeded")));
  EXPECT_EQ(platform.store.connections(), 0U);
}

TEST_F(TransferEnd, ARefreshIsWaitedForWithoutLimit) {
  platform.store.completeRefreshes(RefreshCompletion::whenTold);
  attemptInstall();
  std::jthread daemon([&] { client.assetTransferEndedWithSuccess(true); });
  platform.store.waitUntilPending(1);
  platform.time.advance(std::chrono::hours(24 * 365));
  EXPECT_EQ(platform.store.connections(), 1U);
  EXPECT_FALSE(platform.log.contains(logged("refreshReceiptsWithCompletionBlock succeeded")));
  platform.store.complete();
  daemon.join();
  EXPECT_TRUE(platform.log.contains(logged("refreshReceiptsWithCompletionBlock succeeded")));
  EXPECT_EQ(platform.store.connections(), 0U);
}

TEST_F(TransferEnd, EveryQueuedInstallIsWaitedForBeforeTheHomeScreenHearsOfTheEnd) {
  platform.registry.installGate.close();
  client._enqueueAssetInstall(receivedAsset("com.a"));
  client._enqueueAssetInstall(receivedAsset("com.b"));
  platform.registry.installGate.waitUntilStopped(2);
  std::jthread daemon([&] { client.assetTransferEndedWithSuccess(true); });
  platform.time.advance(std::chrono::hours(24 * 365));
  EXPECT_TRUE(platform.notify.posts().empty());
  platform.registry.installGate.open();
  daemon.join();
  const auto order =
      platform.journal.lines({"homeScreen.release", "systemNotify.post", "softwareLibrary.refreshReceipts"});
  ASSERT_EQ(order.size(), 4U);
  EXPECT_TRUE(sameLines({"systemNotify.post com.corvel.solvary.zeph.wsyncnotify", "softwareLibrary.refreshReceipts"},
                        {order[2], order[3]}));
}

TEST_F(TransferEnd, AnInstallThatIsToBeTriedAgainIsWaitedFor) {
  platform.screen.answerNext("com.a", {AssertionAnswer::denied()});
  client._enqueueAssetInstall(receivedAsset("com.a"));
  platform.time.waitUntilScheduled(1);
  std::jthread daemon([&] { client.assetTransferEndedWithSuccess(true); });
  EXPECT_TRUE(platform.notify.posts().empty());
  platform.time.advance(std::chrono::seconds(30));
  daemon.join();
  EXPECT_EQ(platform.registry.installs().size(), 1U);
  EXPECT_EQ(platform.notify.posts(), (std::vector<Post>{{std::string(kNotification), 0}}));
}

TEST_F(TransferEnd, AnOutstandingTransferIsClosedAsFinishedWhenTheEndIsASuccess) {
  beginTransfer("com.a");
  const auto progress = platform.registry.app("com.a")->progress;
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(progress->installState(), TSInstallState::Finished);
  EXPECT_EQ(platform.registry.app("com.a")->progress, nullptr) << "the registry shows it no longer";
}

TEST_F(TransferEnd, AnOutstandingTransferIsClosedAsFailedWhenTheEndIsNone) {
  beginTransfer("com.a");
  const auto progress = platform.registry.app("com.a")->progress;
  platform.log.clear();
  client.assetTransferEndedWithSuccess(false);
  EXPECT_EQ(progress->installState(), TSInstallState::Failed);
  EXPECT_TRUE(sameLines(
      LogLines{logged("asset transfer ended withsuccess: n"), logged("Notifying SV we are done syncing"),
               logged("Setting state for outstanding DCX loading phase of asset com.a to TSInstallStateFailed"),
               loggedError("Returning progress of com.a progress for com.a")},
      platform.log.lines()));
}

TEST_F(TransferEnd, AnOutstandingTransferWithoutProgressIsOnlyLogged) {
  client.assetTransferUpdatedProgress(receivedAsset("com.unknown"), 0.5);
  platform.log.clear();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(sameLines(
      LogLines{logged("asset transfer ended withsuccess: y"), logged("Notifying SV we are done syncing"),
               logged("Setting state for outstanding DCX loading phase of asset com.unknown to TSInstallStateFinished"),
               loggedError("Returning (null) progress for com.unknown"),
               loggedError("Called with success == YES but with 1 outstanding DCX transfers!")},
      platform.log.lines()));
  EXPECT_EQ(platform.journal.count("registry.installPhaseFinishedForProgress"), 0U);
}

TEST_F(TransferEnd, TransfersAreOutstandingUntilTheEndAndNoLonger) {
  beginTransfer("com.a");
  client.assetTransferEndedWithSuccess(true);
  platform.log.clear();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(
      sameLines(LogLines{logged("asset transfer ended withsuccess: y"), logged("Notifying SV we are done syncing")},
                platform.log.lines()));
}

TEST_F(TransferEnd, ATransferThatEndedIsNotOutstanding) {
  beginTransfer("com.a");
  client.assetTransferSucceeded(receivedAsset("com.a"), true, std::nullopt);
  platform.log.clear();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_FALSE(platform.log.contains(loggedError("Called with success == YES but with 1 outstanding DCX transfers!")));
}

TEST_F(TransferEnd, ParallelReportsLoseNoTransfer) {
  constexpr std::size_t kThreads = 8;
  constexpr int kReports = 100;
  runOnThreads(kThreads, [&](std::size_t thread) {
    for (int number = 0; number < kReports; ++number) {
      const std::string identifier = "com." + std::to_string(thread) + "." + std::to_string(number);
      const auto asset = std::make_shared<ZTAsset>(identifier, "Application", std::nullopt);
      client.assetTransferUpdatedProgress(asset, 0.25);
      if (number % 2 == 0) client.assetTransferSucceeded(asset, true, std::nullopt);
    }
  });
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(platform.log.contains(loggedError("Called with success == YES but with 400 outstanding DCX transfers!")));
}

TEST_F(TransferEnd, AFailedNotificationDoesNotKeepTransfersOpen) {
  beginTransfer("com.a");
  platform.notify.failRegistrationsWith(9);
  client.assetTransferEndedWithSuccess(false);
  EXPECT_TRUE(platform.log.contains(loggedError("Uh Oh...can't send notification to SV:9")));
  EXPECT_EQ(platform.registry.app("com.a")->progress, nullptr);
}

/// Work on the access queue, from which waiting for that queue is reported, ends the transfers.
TEST_F(TransferEnd, TheAccessQueueIsAskedForOnlyWhenTransfersAreOutstanding) {
  const auto endOnAccessQueue = [&] {
    bool isReported = false;
    bool isFirst = true;
    platform.journal.setHook([&](std::string_view operation, std::string_view) -> std::optional<Error> {
      if (operation != "fileSystem.readFile" || !std::exchange(isFirst, false)) return std::nullopt;
      try {
        client.assetTransferEndedWithSuccess(false);
      } catch (const std::logic_error&) {
        isReported = true;
      }
      return std::nullopt;
    });
    client.assetInstallSucceeded(*receivedAsset("com.other"));  // Reads the todo list on the access queue.
    platform.journal.setHook(nullptr);
    return isReported;
  };
  EXPECT_FALSE(endOnAccessQueue()) << "the sets of updates and cancellations stay as they are";
  beginTransfer("com.a");
  EXPECT_TRUE(endOnAccessQueue()) << "the sets are emptied";
}

TEST_F(SyncEnd, EveryStepIsTakenInOrder) {
  platform.files.putFolder(kSyncFolder);
  platform.uninstalledList.add("com.a");
  platform.uninstalledList.add("com.b");
  static_cast<void>(client.installedAssets());
  startTrace();
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(sameLines(
      LogLines{logged("sync ended with success: y"), called("fileSystem.touch /var/mobile/Library/ApplicationSync"),
               logged("clearing uninstalled apps: (com.a, com.b)"),
               called("uninstalledApps.clearUninstalled com.a com.b"),
               called("fileSystem.removeItem /var/mobile/Library/ApplicationSync/LastSyncAppState.plist")},
      platform.log.lines()));
}

TEST_F(SyncEnd, AFailedEndTouchesNothing) {
  platform.files.put(kLastSyncState, "state");
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  startTrace();
  client.syncEndedWithSuccess(false);
  EXPECT_TRUE(sameLines(LogLines{logged("sync ended with success: n")}, platform.log.lines()));
  EXPECT_TRUE(platform.files.has(kLastSyncState));
}

TEST_F(SyncEnd, AFailedEndKeepsTheUninstalledAppsForTheNext) {
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  client.syncEndedWithSuccess(false);
  EXPECT_EQ(platform.uninstalledList.identifiers(), std::set<std::string>{"com.a"});
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(platform.uninstalledList.identifiers().empty());
}

TEST_F(SyncEnd, WithoutAnUninstalledListNothingIsCleared) {
  platform.files.putFolder(kSyncFolder);
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(sameLines(LogLines{logged("sync ended with success: y")}, platform.log.lines()));
  EXPECT_EQ(platform.journal.count("uninstalledApps."), 0U);
}

TEST_F(SyncEnd, AnEmptyUninstalledListIsClearedToo) {
  static_cast<void>(client.installedAssets());
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(platform.log.contains(logged("clearing uninstalled apps: ()")));
  EXPECT_TRUE(platform.journal.contains("uninstalledApps.clearUninstalled"));
}

TEST_F(SyncEnd, ExactlyTheAppsThatWereReportedAreCleared) {
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  platform.uninstalledList.add("com.later");
  client.syncEndedWithSuccess(true);
  EXPECT_EQ(platform.uninstalledList.identifiers(), std::set<std::string>{"com.later"});
}

TEST_F(SyncEnd, AListThatWasClearedIsNotClearedAgain) {
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  client.syncEndedWithSuccess(true);
  client.syncEndedWithSuccess(true);
  EXPECT_EQ(platform.journal.count("uninstalledApps.clearUninstalled"), 1U);
}

TEST_F(SyncEnd, AListThatCouldNotBeClearedIsKeptForTheNextSync) {
  platform.files.putFolder(kSyncFolder);
  platform.files.put(kLastSyncState, "state");
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  platform.uninstalledList.failClearingWith(5);
  platform.log.clear();
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(sameLines(LogLines{logged("sync ended with success: y"), logged("clearing uninstalled apps: (com.a)"),
                                 loggedError("Failed to clear uninstalled apps from Instavor.")},
                        platform.log.lines()));
  EXPECT_FALSE(platform.files.has(kLastSyncState)) << "the end goes on";

  platform.uninstalledList.failClearingWith(0);
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(platform.uninstalledList.identifiers().empty());
}

TEST_F(SyncEnd, AFolderWhoseTimesCannotBeSetIsLoggedInTheSystemsWords) {
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  platform.log.clear();
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(sameLines(
      LogLines{logged("sync ended with success: y"),
               loggedError("Failed to update utimes of \"/var/mobile/Library/ApplicationSync\": No such file or "
                           "directory"),
               logged("clearing uninstalled apps: (com.a)")},
      platform.log.lines()));
}

TEST_F(SyncEnd, TheFolderIsTouchedOnce) {
  platform.files.putFolder(kSyncFolder);
  client.syncEndedWithSuccess(true);
  EXPECT_EQ(platform.files.touches(kSyncFolder), 1U);
}

TEST_F(SyncEnd, TheLastSyncStateIsRemovedAndNothingElse) {
  platform.files.put(kLastSyncState, "state");
  platform.files.put(kTodoListPath, "list");
  client.syncEndedWithSuccess(true);
  EXPECT_EQ(platform.files.paths(kSyncFolder),
            (std::vector<std::string>{"/var/mobile/Library/ApplicationSync/HarvoStuff/", std::string(kTodoListPath)}));
}

}  // namespace appsync::test
