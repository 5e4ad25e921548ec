// The end of the transfers on a device that installs through coordinators.
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using Strings = std::vector<std::string>;

class TransferEndCoordination : public ClientFixture {
 protected:
  /// A client to whom the host has begun to send these apps.
  AppsClient& sending(const Strings& identifiers) {
    platform.coordination.enable();
    AppsClient& client = makeClient();
    for (const std::string& identifier : identifiers) {
      platform.coordination.add(FakeCoordinator::of(identifier));
      client.assetTransferUpdatedProgress(asset(identifier), 0.25);
    }
    platform.log.clear();
    platform.journal.clear();
    return client;
  }

  static std::shared_ptr<platform::ZTAsset> asset(const std::string& identifier) {
    return std::make_shared<platform::ZTAsset>(identifier, "Application", std::nullopt);
  }
};

TEST_F(TransferEndCoordination, AfterAFailureWhatIsOutstandingIsCancelledThroughTheService) {
  AppsClient& client = sending({"com.a", "com.b"});
  client.assetTransferEndedWithSuccess(false);
  EXPECT_EQ(
      platform.journal.lines({"coordinator.", "registry.", "progress."}),
      (Strings{"coordinator.cancelForReason com.a ZTError 30 3", "coordinator.cancelForReason com.b ZTError 30 3"}));
  EXPECT_TRUE(platform.coordination.coordinators().empty());
}

TEST_F(TransferEndCoordination, AfterASuccessWhatIsOutstandingIsOnlyComplainedAbout) {
  AppsClient& client = sending({"com.a"});
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
  EXPECT_TRUE(platform.log.contains(loggedError("Called with success == YES but with 1 outstanding DCX transfers!")));
}

TEST_F(TransferEndCoordination, WhatWasOutstandingIsForgotten) {
  AppsClient& client = sending({"com.a"});
  client.assetTransferEndedWithSuccess(false);
  platform.journal.clear();
  client.assetTransferEndedWithSuccess(false);
  EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
}

TEST_F(TransferEndCoordination, WithNothingOutstandingTheServiceIsNotAsked) {
  AppsClient& client = sending({});
  client.assetTransferEndedWithSuccess(false);
  EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
}

TEST_F(TransferEndCoordination, WithNothingOutstandingTheMarksOfUpdatesAreKept) {
  platform.coordination.enable();
  platform.registry.add(FakeApp::installed("com.a"));
  platform.files.put(kTodoListPath, binaryForm(plist::Array{installEntry("com.a")}));
  AppsClient& client = makeClient();
  EXPECT_EQ(client.outstandingAssetTransfers().size(), 1U);
  client.assetTransferEndedWithSuccess(false);
  client.assetTransferSucceeded(asset("com.a"), true, std::nullopt);
  EXPECT_TRUE(
      platform.log.contains(logged("transfer for asset com.a ended with success y error (null) existingApp:1")));
}

TEST_F(TransferEndCoordination, TheMarksOfUpdatesGoWithWhatIsOutstanding) {
  platform.coordination.enable();
  platform.registry.add(FakeApp::installed("com.a"));
  platform.files.put(kTodoListPath, binaryForm(plist::Array{installEntry("com.a")}));
  AppsClient& client = makeClient();
  EXPECT_EQ(client.outstandingAssetTransfers().size(), 1U);
  client.assetTransferUpdatedProgress(asset("com.b"), 0.25);
  client.assetTransferEndedWithSuccess(false);
  client.assetTransferSucceeded(asset("com.a"), true, std::nullopt);
  EXPECT_TRUE(
      platform.log.contains(logged("transfer for asset com.a ended with success y error (null) existingApp:0")));
}

TEST_F(TransferEndCoordination, WithNothingOutstandingUserCancellationsAreKept) {
  platform.coordination.enable();
  AppsClient& client = makeClient();
  client.setupInstallCoordinatorObserver();
  const auto cancel = [this] {
    platform.coordination.add(FakeCoordinator::of("com.a"));
    platform.coordination.cancelByUser("com.a", CallbackOn::callingThread);
  };
  cancel();
  client.assetTransferEndedWithSuccess(false);
  cancel();
  EXPECT_EQ(platform.journal.count("deviceService.cancelAssetTransferForFailedAsset"), 1U);
}

}  // namespace
}  // namespace appsync::test
