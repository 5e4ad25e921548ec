// The end of syncing altogether.
#include <optional>
#include <set>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/SyncFileBuilder.h"
#include "kit/fakes/TextDiff.h"
#include "tests/core/SyncEndFixture.h"

namespace appsync::test {

namespace {

class ClearSyncData : public SyncEndFixture {};

}  // namespace

TEST_F(ClearSyncData, EveryStepIsTakenInOrder) {
  platform.files.put(kTodoListPath, "list");
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.registry.add(FakeApp::installed("com.b"));
  platform.registry.add(FakeApp::updating("com.c"));
  platform.uninstalledList.add("com.gone");
  startTrace();
  client.clearSyncData();
  EXPECT_TRUE(sameLines(
      LogLines{logged("blasting work area"), called("fileSystem.removeItem /var/mobile/Library/ApplicationSync"),
               logged("Uninstalling all placeholder apps"), called("registry.enumerateBundlesOfType 0"),
               called("registry.uninstallApplication com.a"), logged("Uninstall com.a = y"),
               called("registry.uninstallApplication com.c"), logged("Uninstall com.c = y"),
               called("uninstalledApps.lookupUninstalled"), called("uninstalledApps.clearUninstalled com.gone")},
      platform.log.lines()));
  EXPECT_FALSE(platform.files.has(kSyncFolder));
  EXPECT_EQ(platform.registry.identifiers(), (std::vector<std::string>{"com.b", "com.c"}));
  EXPECT_TRUE(platform.registry.app("com.c")->isInstalled);
  EXPECT_FALSE(platform.registry.app("com.c")->isPlaceholder);
  EXPECT_TRUE(platform.uninstalledList.identifiers().empty());
}

TEST_F(ClearSyncData, WithNothingToClearNoErrorIsLogged) {
  platform.files.putFolder(kSyncFolder);
  client.clearSyncData();
  EXPECT_FALSE(platform.files.has(kSyncFolder));
  EXPECT_TRUE(sameLines(LogLines{logged("blasting work area"), logged("Uninstalling all placeholder apps")},
                        platform.log.lines()));
  EXPECT_TRUE(platform.journal.contains("uninstalledApps.clearUninstalled"));
}

/// Otherwise the list that is being written would stay, or keep its folder from going. Waiting for the queue from its
/// own work is reported.
TEST_F(ClearSyncData, NothingIsClearedWhileTheTodoListIsBeingChanged) {
  putPropertyList(platform.files, kTodoListPath, plist::Array{installEntry("com.a")});
  bool isReported = false;
  platform.journal.setHook([&](std::string_view operation, std::string_view) -> std::optional<Error> {
    if (operation != "fileSystem.writeFileAtomically" || isReported) return std::nullopt;
    try {
      client.clearSyncData();
    } catch (const std::logic_error&) {
      isReported = true;
    }
    return std::nullopt;
  });
  client.assetInstallSucceeded(*receivedAsset("com.a"));
  platform.journal.setHook(nullptr);
  EXPECT_TRUE(isReported);
  EXPECT_TRUE(platform.files.has(kTodoListPath));
}

TEST_F(ClearSyncData, AnAbsentFolderIsNoError) {
  client.clearSyncData();
  EXPECT_TRUE(sameLines(LogLines{logged("blasting work area"), logged("Uninstalling all placeholder apps")},
                        platform.log.lines()));
}

TEST_F(ClearSyncData, APlaceholderThatCannotBeRemovedDoesNotStopTheOthers) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.registry.add(FakeApp::placeholder("com.b"));
  platform.registry.failures.failNext(RegistryOperation::uninstallApplication, "com.a",
                                      Error{"InstallerError", 3, "busy", {}});
  client.clearSyncData();
  EXPECT_TRUE(sameLines(LogLines{logged("blasting work area"), logged("Uninstalling all placeholder apps"),
                                 logged("Uninstall com.a = n"), logged("Uninstall com.b = y")},
                        platform.log.lines()));
}

TEST_F(ClearSyncData, PlaceholdersAreRemovedByTheirBundleIdentifierWithoutOptions) {
  platform.registry.add(FakeApp::placeholder("com.a").withBundleIdentifier("com.other"));
  client.clearSyncData();
  EXPECT_EQ(platform.registry.uninstalls(), (std::vector<FakeAppRegistry::Uninstall>{{"com.other", {}}}));
  EXPECT_TRUE(platform.log.contains(logged("Uninstall com.other = n")));
}

TEST_F(ClearSyncData, APlaceholderWithoutABundleIdentifierIsRemovedByItsApps) {
  platform.registry.add(FakeApp::placeholder("com.a").withBundleIdentifier(std::nullopt));
  client.clearSyncData();
  EXPECT_EQ(platform.registry.uninstalls(), (std::vector<FakeAppRegistry::Uninstall>{{"com.a", {}}}));
}

TEST_F(ClearSyncData, AnUninstalledListThatCannotBeHadIsLogged) {
  platform.uninstalledList.loseAnswers();
  client.clearSyncData();
  EXPECT_TRUE(sameLines(LogLines{logged("blasting work area"), logged("Uninstalling all placeholder apps"),
                                 loggedError("Failed to fetch uninstalled apps list to clear it")},
                        platform.log.lines()));
  EXPECT_EQ(platform.journal.count("uninstalledApps.clearUninstalled"), 0U);
}

TEST_F(ClearSyncData, AnUninstalledListThatCannotBeClearedIsLogged) {
  platform.uninstalledList.failClearingWith(5);
  client.clearSyncData();
  EXPECT_TRUE(sameLines(LogLines{logged("blasting work area"), logged("Uninstalling all placeholder apps"),
                                 loggedError("Failed to clear uninstalled apps list")},
                        platform.log.lines()));
}

TEST_F(ClearSyncData, TheListThatASyncRememberedIsNotTouched) {
  platform.uninstalledList.add("com.a");
  static_cast<void>(client.installedAssets());
  client.clearSyncData();
  platform.journal.clear();
  client.syncEndedWithSuccess(true);
  EXPECT_TRUE(platform.journal.contains("uninstalledApps.clearUninstalled com.a"));
}

}  // namespace appsync::test
