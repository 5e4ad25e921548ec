// What the daemon sets off once a host has restored the device.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/restore/RestoreFixture.h"

namespace appsync::test {
namespace {

class RestoreReconcile : public RestoreFixture {
 protected:
  [[nodiscard]] std::vector<std::string> processed() const {
    std::vector<std::string> identifiers;
    for (const auto& install : platform.registry.installs())
      identifiers.push_back(install.identifier);
    return identifiers;
  }
};

LogLines beginning(int type) {
  return {logged("reconcileRestoreOfType " + std::to_string(type)),
          called("systemNotify.registerCheck com.corvel.solvary.zeph.wsyncnotify"),
          logged("Notifying SV we are starting syncing"),
          called("homeScreen.blockableServerPort"),
          called("systemNotify.setState com.corvel.solvary.zeph.wsyncnotify 1"),
          called("systemNotify.post com.corvel.solvary.zeph.wsyncnotify"),
          called("fileSystem.createDirectory /var/mobile/Library/ApplicationSync")};
}

LogLines joined(LogLines lines, const LogLines& more) {
  lines.insert(lines.end(), more.begin(), more.end());
  return lines;
}

TEST_F(RestoreReconcile, AnotherTypeLeavesTheHostsFileUntouched) {
  for (const int type : {0, 1, 3, -2}) {
    putRestoreInfo({{"com.a", restoredApp()}});
    platform.files.erase("/var/mobile/Library/ApplicationSync");
    AppsClient& client = makeTracedClient();
    EXPECT_TRUE(client.reconcileRestoreOfType(type, nullptr));
    EXPECT_TRUE(sameLines(beginning(type), platform.log.lines()));
    EXPECT_TRUE(platform.files.hasFolder("/var/mobile/Library/ApplicationSync"));
    EXPECT_TRUE(platform.files.has(kRestoreInfo));
    EXPECT_FALSE(platform.files.has(kFiledRestoreInfo));
  }
}

TEST_F(RestoreReconcile, WithoutAHostFileNothingIsWrittenOrMoved) {
  AppsClient& client = makeTracedClient();
  EXPECT_TRUE(client.reconcileRestoreOfType(kHostRestore, nullptr));
  EXPECT_TRUE(sameLines(
      joined(beginning(2), {called("fileSystem.fileExists /var/mobile/Media/HarvoRestore/RestoreApplications.plist"),
                            logged("no harvo restore plist found - skipping processing of harvo restored apps")}),
      platform.log.lines()));
  EXPECT_TRUE(client._processHarvoRestoreInfo());
}

TEST_F(RestoreReconcile, TheErrorSlotIsCleared) {
  platform.files.failures.failAlways(FileOperation::createDirectory, kAnything, error);
  std::optional<Error> slot = error;
  EXPECT_TRUE(makeClient().reconcileRestoreOfType(1, &slot));
  EXPECT_EQ(slot, std::nullopt);
}

TEST_F(RestoreReconcile, ItSucceedsWhateverComesOfTheApps) {
  putRestoreInfo({{"com.a", restoredApp({})}});
  AppsClient& client = makeClient();
  EXPECT_TRUE(client.reconcileRestoreOfType(kHostRestore, nullptr));
  expectFiledAway();
  putRestoreInfo({{"com.a", restoredApp({})}});
  EXPECT_FALSE(client._processHarvoRestoreInfo());
}

TEST_F(RestoreReconcile, EveryStepIsTakenInOrder) {
  putRestoreInfo({{"com.a", restoredApp()}});
  EXPECT_TRUE(makeTracedClient()._processHarvoRestoreInfo());
  const std::string path(kRestoreInfo);
  const std::string filed(kFiledRestoreInfo);
  const std::string folder(kAppFolder);
  const std::string info =
      "{BundleDisplayName = \"An App\"; BundleExecutable = \"An App\"; BundleIconFile = Icon.png; "
      "BundleIdentifier = com.a; BundleVersion = 2.0; TSApplicationLaunchProhibited = 0; UIPeriodixApp = 0;}";
  EXPECT_TRUE(
      sameLines({called("fileSystem.fileExists " + path),
                 called("fileSystem.readFile " + path),
                 logged("processing harvo restore info"),
                 called("fileSystem.readFile " + std::string(kDemotedApps)),
                 loggedIn(14, "Demoted Apps: (null)"),
                 called("registry.enumerateBundlesOfType 1"),
                 logged("processing harvo restore info for 'com.a' demotionStatus :0"),
                 logged("processing app restore info for 'com.a'"),
                 called("fileSystem.temporaryDirectory"),
                 called("fileSystem.createDirectory " + folder),
                 logged("Created app directory for 'com.a' at " + folder + " with err=(null)"),
                 called("fileSystem.createFile " + folder + "/Icon.png"),
                 called("fileSystem.attributesOfItem " + folder + "/Icon.png"),
                 logged("icon data for 'com.a' was writen to " + folder + "/Icon.png with status:1 fileSize:9"),
                 logged("creating placeholder for 'com.a'. info.plist=" + info),
                 called("fileSystem.writeFileAtomically " + folder + "/Info.plist"),
                 called("registry.installApplication com.a " + folder),
                 logged("Installed Placeholder app from path " + folder + ": An App [com.a 2.0] [isPeriodix: 0]"),
                 called("transactionLog.logScenario Harvo App Restore com.a y Installed placeholder"),
                 logged("Will wait for 0 seconds for 0 placeholders to install"),
                 logged("Finished waiting for placeholder installs"),
                 called("fileSystem.removeItem " + filed),
                 called("fileSystem.moveItem " + path + " " + filed)},
                platform.log.lines()));
}

TEST_F(RestoreReconcile, AnEarlierFiledCopyIsReplaced) {
  platform.files.put(kFiledRestoreInfo, "of last year");
  putRestoreInfo({});
  EXPECT_FALSE(makeClient()._processHarvoRestoreInfo());
  expectFiledAway();
  EXPECT_EQ(platform.files.contents(kFiledRestoreInfo), binaryForm(plist::Dictionary{}));
}

TEST_F(RestoreReconcile, AFileThatCannotBeMovedIsSaidAndTheResultStands) {
  putRestoreInfo({{"com.a", restoredApp()}});
  platform.files.failures.failAlways(FileOperation::moveItem, kRestoreInfo, error);
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  EXPECT_TRUE(said("failed to copy harvo metadata. err=" + description(error)));
  EXPECT_TRUE(platform.files.has(kRestoreInfo));
}

TEST_F(RestoreReconcile, AFileThatCannotBeReadIsFiledAwayWithoutAWait) {
  putRestoreInfo({{"com.a", restoredApp()}});
  platform.files.failures.failNext(FileOperation::readFile, kRestoreInfo, error);
  EXPECT_FALSE(makeClient()._processHarvoRestoreInfo());
  EXPECT_TRUE(
      sameLines({logged("failed to read harvo app restore info. err=" + description(error))}, platform.log.lines()));
  expectFiledAway();
}

TEST_F(RestoreReconcile, AFileThatDoesNotParseIsFiledAwayWithoutAWaitAndReportsStillCount) {
  platform.files.put(kRestoreInfo, "bplist00 and then nothing of the kind");
  AppsClient& client = makeClient();
  EXPECT_FALSE(client._processHarvoRestoreInfo());
  const std::vector<std::string> messages = platform.log.messages();
  ASSERT_EQ(messages.size(), 2U);
  EXPECT_EQ(messages[0], "processing harvo restore info");
  EXPECT_TRUE(messages[1].starts_with("failed to parse harvo app restore info. err=PropertyList "));
  EXPECT_TRUE(processed().empty());
  expectFiledAway();
  client.cnDidInstallPlaceHolderForAppBundle("com.b");
  EXPECT_TRUE(complained("Ignoring notification from CN about installing placeholder for com.b"));
}

TEST_F(RestoreReconcile, AppsAreTakenInTheOrderOfTheirKeys) {
  putRestoreInfo({{"com.c", restoredApp()}, {"com.a", restoredApp()}, {"com.b", restoredApp()}});
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  EXPECT_EQ(processed(), (std::vector<std::string>{"com.a", "com.b", "com.c"}));
}

TEST_F(RestoreReconcile, AnAppThatIsThereAlreadyIsLeftAlone) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.registry.add(FakeApp::installed("com.b"));
  platform.registry.addBundle("com.c", platform::BundleKind::user);
  putRestoreInfo(
      {{"com.a", restoredApp()}, {"com.b", restoredApp()}, {"com.c", restoredApp()}, {"com.D", restoredApp()}});
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  for (const std::string identifier : {"com.a", "com.b", "com.c"}) {
    EXPECT_TRUE(said("Found placeholder for bundle " + identifier));
    EXPECT_TRUE(said("placeholder already exists for '" + identifier + "' - skiping'"));
  }
  EXPECT_EQ(processed(), (std::vector<std::string>{"com.D"}));
}

TEST_F(RestoreReconcile, TheRegistryIsWalkedOnceForAnyNumberOfApps) {
  putRestoreInfo({{"com.a", restoredApp()}, {"com.b", restoredApp()}, {"com.c", restoredApp()}});
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  EXPECT_EQ(platform.journal.count("registry.enumerateBundlesOfType"), 1U);
}

TEST_F(RestoreReconcile, TheResultIsThatOfTheLastAppThatWasProcessed) {
  const plist::Dictionary bad = restoredApp({});
  putRestoreInfo({{"com.a", bad}, {"com.b", restoredApp()}, {"com.c", plist::Dictionary{}}});
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  platform.files.erase(kFiledRestoreInfo);
  putRestoreInfo({{"com.x", restoredApp()}, {"com.y", bad}, {"com.z", "nothing"}});
  EXPECT_FALSE(makeClient()._processHarvoRestoreInfo());
}

TEST_F(RestoreReconcile, AFileWithNothingToDoIsAFailure) {
  platform.registry.add(FakeApp::installed("com.a"));
  putRestoreInfo({{"com.a", restoredApp()}});
  EXPECT_FALSE(makeClient()._processHarvoRestoreInfo());
  expectFiledAway();
}

TEST_F(RestoreReconcile, AFailedAppDoesNotStopTheOthers) {
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", error);
  putRestoreInfo({{"com.a", restoredApp()}, {"com.b", restoredApp()}});
  EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
  EXPECT_EQ(platform.registry.identifiers(), (std::vector<std::string>{"com.b"}));
}

TEST_F(RestoreReconcile, ASecondRunFindsNothingToDo) {
  putRestoreInfo({{"com.a", restoredApp()}});
  AppsClient& client = makeClient();
  EXPECT_TRUE(client._processHarvoRestoreInfo());
  EXPECT_TRUE(client._processHarvoRestoreInfo());
  EXPECT_TRUE(said("no harvo restore plist found - skipping processing of harvo restored apps"));
  EXPECT_EQ(processed().size(), 1U);
}

TEST_F(RestoreReconcile, EveryFormOfTheFileIsRead) {
  const plist::Dictionary apps{{"com.a", restoredApp()}};
  for (const Bytes& document : {binaryForm(apps), xmlForm(apps)}) {
    platform.files.put(kRestoreInfo, document);
    EXPECT_TRUE(makeClient()._processHarvoRestoreInfo());
    EXPECT_EQ(platform.files.text(kAppIcon), "a picture");
    EXPECT_TRUE(platform.registry.uninstallApplication("com.a"));
    platform.files.erase(kAppFolder);
  }
}

}  // namespace
}  // namespace appsync::test
