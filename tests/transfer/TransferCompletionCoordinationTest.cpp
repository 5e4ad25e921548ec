// What becomes of a package on a device that installs through coordinators.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::CoordinatorKind;
using platform::TSInstallType;
using Strings = std::vector<std::string>;

class TransferCompletionCoordination : public CoordinationFixture {
 protected:
  void SetUp() override {
    CoordinationFixture::SetUp();
    platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff");
    platform.files.put(kTodoListPath, binaryForm(plist::Array{entry("com.a", "install")}));
    platform.files.put(kReceivedPackage, "package");
    received_->setIsDownload(true);
    received_->setPath("com.a.zip");
    received_->setDownloadProgress(0.5);
  }

  /// A client that has asked the host for the app.
  AppsClient& makeAsking() {
    AppsClient& client = makeClient();
    EXPECT_EQ(client.outstandingAssetTransfers().size(), 1U);
    client.setupInstallCoordinatorObserver();
    platform.log.clear();
    platform.journal.clear();
    return client;
  }

  void showPlaceholder() { platform.registry.add(FakeApp::placeholder("com.a")); }

  const std::shared_ptr<platform::ZTAsset> received_ =
      std::make_shared<platform::ZTAsset>("com.a", "Application", "An App");
  const Error lost_{"ZTError", 7, "lost the host", nullptr};
};

TEST_F(TransferCompletionCoordination, ProgressGoesToTheCoordinator) {
  makeAsking().assetTransferUpdatedProgress(received_, 0.75);
  EXPECT_EQ(platform.coordination.promise("com.a-Asset")->percentComplete, 0.5);
  EXPECT_EQ(platform.journal.count("registry."), 0U);
  EXPECT_EQ(platform.log.messages().front(), "finished transferring 0.750000 for com.a");
}

TEST_F(TransferCompletionCoordination, AnUpdatesProgressGoesToTheUpdatingCoordinator) {
  platform.registry.add(FakeApp::installed("com.a"));
  makeAsking().assetTransferUpdatedProgress(received_, 0.75);
  EXPECT_TRUE(platform.journal.contains("installCoordination.coordinatorForApp updating com.a find"));
}

TEST_F(TransferCompletionCoordination, ATransferWithProgressIsOutstanding) {
  AppsClient& client = makeAsking();
  client.assetTransferUpdatedProgress(received_, 0.75);
  client.assetTransferEndedWithSuccess(false);
  EXPECT_TRUE(platform.coordination.coordinators().empty());
}

TEST_F(TransferCompletionCoordination, AReceivedPackageIsHandedToTheCoordinator) {
  AppsClient& client = makeAsking();
  client.assetTransferSucceeded(received_, true, std::nullopt);
  EXPECT_EQ(platform.coordination.promise("com.a-Asset")->transferPath, platform::FileLocation::file(kReceivedPackage));
  EXPECT_TRUE(platform.coordination.promise("com.a-Asset")->isComplete);
  EXPECT_EQ(operationWord(platform.files, "com.a"), "DOWNLOADED");
  EXPECT_TRUE(said("Installing synced asset com.a"));
  EXPECT_FALSE(said("Enqueue install request for com.a"));
  EXPECT_TRUE(platform.registry.installs().empty());
}

TEST_F(TransferCompletionCoordination, AnUpdateIsHandedToTheUpdatingCoordinator) {
  platform.registry.add(FakeApp::installed("com.a"));
  AppsClient& client = makeAsking();
  client.assetTransferSucceeded(received_, true, std::nullopt);
  EXPECT_EQ(platform.coordination.coordinator("com.a")->kind, CoordinatorKind::updating);
  EXPECT_TRUE(platform.coordination.promise("com.a-Asset")->isComplete);
}

TEST_F(TransferCompletionCoordination, AMarkIsUsedUpByOneTransfer) {
  platform.registry.add(FakeApp::installed("com.a"));
  AppsClient& client = makeAsking();
  client.assetTransferSucceeded(received_, true, std::nullopt);
  client.assetTransferSucceeded(received_, true, std::nullopt);
  EXPECT_TRUE(said("transfer for asset com.a ended with success y error (null) existingApp:1"));
  EXPECT_TRUE(said("transfer for asset com.a ended with success y error (null) existingApp:0"));
}

TEST_F(TransferCompletionCoordination, ARestoresPackageIsNotTheSyncsToInstall) {
  AppsClient& client = makeAsking();
  received_->setIsRestore(true);
  received_->setCompletedAssetParts(platform::kZTAssetPartApplication);
  client.assetTransferSucceeded(received_, true, std::nullopt);
  EXPECT_TRUE(said("Not processing restore asset com.a as coordination is enabled"));
  EXPECT_EQ(platform.journal.count("backupManager.restoreDataExists"), 0U);
  EXPECT_FALSE(platform.coordination.promise("com.a-Asset")->isComplete);
}

TEST_F(TransferCompletionCoordination, ARestoresDataIsNotTheSyncsToInstall) {
  AppsClient& client = makeAsking();
  received_->setIsRestore(true);
  received_->setCompletedAssetParts(platform::kZTAssetPartApplicationData);
  client.assetTransferSucceeded(received_, true, std::nullopt);
  EXPECT_TRUE(said("Not processing kZTAssetPartApplicationData for restore asset com.a as coordination is enabled"));
  EXPECT_FALSE(said("Enqueue install request for com.a"));
}

TEST_F(TransferCompletionCoordination, AFailedTransferEndsTheCoordinator) {
  AppsClient& client = makeAsking();
  showPlaceholder();
  platform.framework.judgeErrorsBy([](const Error&) { return true; });
  client.assetTransferSucceeded(received_, false, lost_);
  EXPECT_TRUE(said("failed to transfer asset Application/com.a. err=" + description(lost_) + ", recoverable=0"));
  EXPECT_TRUE(said("Uninstalling placeholder com.a"));
  ASSERT_TRUE(cancellation());
  EXPECT_EQ(*cancellation()->reason.underlying, lost_);
  EXPECT_TRUE(platform.registry.uninstalls().empty());
}

TEST_F(TransferCompletionCoordination, AFailedTransferOfAnUpdateEndsTheUpdatingCoordinator) {
  platform.registry.add(FakeApp::installed("com.a"));
  AppsClient& client = makeAsking();
  client.assetTransferSucceeded(received_, false, lost_);
  EXPECT_TRUE(platform.coordination.coordinators().empty());
  EXPECT_TRUE(platform.registry.app("com.a"));
}

TEST_F(TransferCompletionCoordination, AFailedTransferOfAnAppThatTheUserCancelledIsLeftAtThat) {
  AppsClient& client = makeAsking();
  showPlaceholder();
  platform.coordination.cancelByUser("com.a", CallbackOn::callingThread);
  platform.coordination.add(prepared());
  platform.journal.clear();
  client.assetTransferSucceeded(received_, false, lost_);
  EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);

  client.assetTransferSucceeded(received_, false, lost_);  // The cancellation is used up.
  EXPECT_TRUE(platform.coordination.coordinators().empty());
}

TEST_F(TransferCompletionCoordination, AFailedTransferOfAnUnknownAppIsOnlyLogged) {
  AppsClient& client = makeAsking();
  client.assetTransferSucceeded(received_, false, lost_);
  EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
  EXPECT_FALSE(said("Uninstalling placeholder com.a"));
}

TEST_F(TransferCompletionCoordination, ARestoreThatBecomesOneMeanwhileIsNotCancelledAtTheBackup) {
  AppsClient& client = makeAsking();
  showPlaceholder();
  client.assetTransferSucceeded(std::make_shared<ReclassifiedAsset>("com.a", std::vector<bool>{false, true}), false,
                                lost_);
  EXPECT_TRUE(said("Install coordination is enabled - not calling cancelApplicationRestoreWithBundleID for com.a"));
  EXPECT_EQ(platform.journal.count("backupManager."), 0U);
  EXPECT_TRUE(platform.coordination.coordinators().empty());
}

TEST_F(TransferCompletionCoordination, EachTransferGivesUpWhatItsAppHadOfUpdatesAndCancellations) {
  AppsClient& client = makeAsking();
  platform.coordination.cancelByUser("com.a", CallbackOn::callingThread);
  client.assetTransferSucceeded(received_, true, std::nullopt);
  platform.coordination.add(prepared());
  platform.journal.clear();
  platform.coordination.cancelByUser("com.a", CallbackOn::callingThread);
  EXPECT_TRUE(platform.journal.contains("deviceService.cancelAssetTransferForFailedAsset com.a"));
}

}  // namespace
}  // namespace appsync::test
