// Which packages the host is asked for on a device that installs through coordinators.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using platform::CoordinatorKind;
using platform::TSInstallType;
using Strings = std::vector<std::string>;

class OutstandingAssetTransfersCoordination : public ClientFixture {
 protected:
  void SetUp() override {
    platform.coordination.enable();
    platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff");
  }

  void request(const Strings& identifiers) {
    plist::Array entries;
    for (const std::string& identifier : identifiers)
      entries.emplace_back(installEntry(identifier));
    platform.files.put(kTodoListPath, binaryForm(std::move(entries)));
  }

  Strings outstanding() {
    AppsClient& client = makeClient();
    platform.log.clear();
    Strings identifiers;
    for (const auto& asset : client.outstandingAssetTransfers())
      identifiers.push_back(asset->identifier());
    return identifiers;
  }

  [[nodiscard]] bool said(std::string_view message) const { return platform.log.contains(logged(message)); }
};

TEST_F(OutstandingAssetTransfersCoordination, ANewAppIsPreparedThroughACoordinator) {
  request({"com.a"});
  EXPECT_EQ(outstanding(), Strings{"com.a"});
  EXPECT_EQ(platform.coordination.coordinator("com.a")->kind, CoordinatorKind::initiating);
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_TRUE(platform.journal.contains("registry.recordForIdentifier com.a"));
  EXPECT_FALSE(said("App com.a is already installed and will be updated."));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "install");
}

TEST_F(OutstandingAssetTransfersCoordination, AnInstalledAppIsUpdatedAndItsTransferCountsAsAnUpdate) {
  platform.registry.add(FakeApp::installed("com.a"));
  request({"com.a"});
  EXPECT_EQ(outstanding(), Strings{"com.a"});
  EXPECT_EQ(platform.coordination.coordinator("com.a")->kind, CoordinatorKind::updating);
  EXPECT_TRUE(said("App com.a is already installed and will be updated."));
  const auto client = takeClient();
  client->assetTransferSucceeded(std::make_shared<platform::ZTAsset>("com.a", "Application", "A"), true, std::nullopt);
  EXPECT_TRUE(said("transfer for asset com.a ended with success y error (null) existingApp:1"));
}

TEST_F(OutstandingAssetTransfersCoordination, AnAppUnderAPlaceholderIsNoUpdate) {
  platform.registry.add(FakeApp::updating("com.a"));
  request({"com.a"});
  EXPECT_EQ(outstanding(), Strings{"com.a"});
  EXPECT_EQ(platform.coordination.coordinator("com.a")->kind, CoordinatorKind::initiating);
}

TEST_F(OutstandingAssetTransfersCoordination, AnExistingPlaceholderIsReturnedToo) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  EXPECT_EQ(outstanding(), Strings{"com.a"});
  EXPECT_FALSE(said("Not creating a placeholder app for com.a because we already have one"));
}

TEST_F(OutstandingAssetTransfersCoordination, ARefusedAppIsMarkedFailedAndNotReturned) {
  platform.coordination.add(FakeCoordinator::of("com.a").madeBy(platform::ClientIdentity::CXClientBazaarly));
  request({"com.a", "com.b"});
  EXPECT_EQ(outstanding(), Strings{"com.b"});
  EXPECT_TRUE(platform.log.contains(loggedError("Not requesting app asset for com.a")));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "FAILED");
  EXPECT_EQ(operationWord(platform.files, "com.b"), "install");
}

TEST_F(OutstandingAssetTransfersCoordination, ARefusedUpdateDoesNotCountAsOne) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.coordination.failures.failNext("coordinator.setInstallOptions", "com.a", {"CN", 4, "no", nullptr});
  request({"com.a"});
  EXPECT_TRUE(outstanding().empty());
  const auto client = takeClient();
  client->assetTransferSucceeded(std::make_shared<platform::ZTAsset>("com.a", "Application", "A"), true, std::nullopt);
  EXPECT_TRUE(said("transfer for asset com.a ended with success y error (null) existingApp:0"));
}

TEST_F(OutstandingAssetTransfersCoordination, AnAutomaticallyDemotedAppIsReturnedOnlyOnRequest) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Downgrade));
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(said("com.a is currenlty demoted (manual:1, auto:0) - skipping"));
  request({"com.a"});
  EXPECT_EQ(outstanding(), Strings{"com.a"});
  EXPECT_TRUE(
      said("com.a is currenlty demoted (manual:1, auto:0) - but will be installed as it's requested by client"));
}

TEST_F(OutstandingAssetTransfersCoordination, RestoresAndSystemAppsAreNotPrepared) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore));
  platform.registry.add(FakeApp::placeholder("com.b").ofType(platform::kApplicationTypeSystem));
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(platform.coordination.coordinators().empty());
  EXPECT_TRUE(said("com.a is currenlty marked to be restored and will be handled by bazaarlyd - skipping"));
  EXPECT_TRUE(said("com.b is auto demoted: 0, manual demoted: 0, system app:1 - skipping"));
}

}  // namespace
}  // namespace appsync::test
