// CoordinatedInstallContract: promises.
#include "kit/contracts/InstallCoordinationContract.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

TEST_P(CoordinatedInstallContract, PromiseReturnsItsInitialValues) {
  const platform::FileLocation icon = subject().makeIcon();
  const Asset transfer = service().makePromisedTransferToPath("com.a-Icon", kStore, icon, 456);
  ASSERT_NE(transfer, nullptr);
  EXPECT_EQ(transfer->name(), "com.a-Icon");
  EXPECT_EQ(transfer->client(), kStore);
  EXPECT_EQ(transfer->diskSpaceNeeded(), 456U);
  EXPECT_EQ(transfer->transferPath(), icon);
  EXPECT_FALSE(transfer->description().empty());
  const UserData data = service().makePromisedOutOfBandTransfer("com.a-UserData", kSync, 7);
  ASSERT_NE(data, nullptr);
  EXPECT_EQ(data->name(), "com.a-UserData");
  EXPECT_EQ(data->client(), kSync);
  EXPECT_EQ(data->diskSpaceNeeded(), 7U);
  EXPECT_FALSE(data->description().empty());
}

TEST_P(CoordinatedInstallContract, NewPromiseIsNotComplete) {
  const Asset asset = makeAsset();
  EXPECT_EQ(asset->percentComplete(), 0);
  EXPECT_FALSE(asset->isComplete());
  EXPECT_EQ(asset->transferPath(), std::nullopt);
}

TEST_P(CoordinatedInstallContract, TransferPathCanBeSetLater) {
  const Asset asset = makeAsset();
  const platform::FileLocation package = subject().makePackage("com.a", "1.0");
  asset->setTransferPath(package);
  EXPECT_EQ(asset->transferPath(), package);
}

TEST_P(CoordinatedInstallContract, ClampsFractionsOutOfRange) {
  const Asset asset = makeAsset();
  asset->setPercentComplete(0.25);
  EXPECT_EQ(asset->percentComplete(), 0.25);
  asset->setPercentComplete(7);
  EXPECT_EQ(asset->percentComplete(), 1);
  asset->setPercentComplete(-7);
  EXPECT_EQ(asset->percentComplete(), 0);
}

TEST_P(CoordinatedInstallContract, CompletePromiseStaysComplete) {
  const UserData data = makeUserData();
  data->setComplete(false);
  EXPECT_FALSE(data->isComplete());
  data->setComplete(true);
  data->setComplete(false);
  EXPECT_TRUE(data->isComplete());
}

TEST_P(CoordinatedInstallContract, CoordinatorReturnsItsPromise) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = makeAsset("com.a-Asset");
  EXPECT_TRUE(made->setAppAssetPromise(asset));
  const Asset seen = find("com.a")->appAssetPromise();
  ASSERT_NE(seen, nullptr);
  EXPECT_EQ(seen->name(), "com.a-Asset");
  EXPECT_EQ(seen->client(), kSync);
  seen->setPercentComplete(0.5);
  EXPECT_EQ(asset->percentComplete(), 0.5);
}

TEST_P(CoordinatedInstallContract, ServiceKeepsAPromiseReleasedByItsClient) {
  const Coordinator made = coordinator("com.a");
  Asset asset = prepare(*made);
  asset.reset();
  ASSERT_NE(made->appAssetPromise(), nullptr);
  deliver(*made->appAssetPromise(), subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, PromiseCanBeAttachedOnce) {
  const Asset asset = makeAsset();
  EXPECT_TRUE(coordinator("com.a")->setAppAssetPromise(asset));
  EXPECT_FALSE(coordinator("com.b")->setAppAssetPromise(asset));
  EXPECT_FALSE(coordinator("com.b")->hasAppAssetPromise());
  EXPECT_FALSE(makePlaceholder("com.a")->setIconPromise(asset));
  const UserData data = makeUserData();
  EXPECT_TRUE(coordinator("com.a")->setUserDataPromise(data));
  EXPECT_FALSE(coordinator("com.b")->setUserDataPromise(data));
  EXPECT_FALSE(coordinator("com.b")->hasUserDataPromise());
}

TEST_P(CoordinatedInstallContract, RefusesAListWithAnAttachedPromise) {
  const UserData taken = makeUserData("taken");
  const UserData free = makeUserData("free");
  EXPECT_TRUE(coordinator("com.a")->setInitialODRAssetPromises({taken}));
  EXPECT_FALSE(coordinator("com.b")->setInitialODRAssetPromises({free, taken}));
  EXPECT_FALSE(coordinator("com.b")->hasInitialODRAssetPromises());
  EXPECT_TRUE(coordinator("com.b")->setInitialODRAssetPromises({free}));
}

TEST_P(CoordinatedInstallContract, RefusedPromiseCanBeAttachedElsewhere) {
  EXPECT_TRUE(coordinator("com.a")->setAppAssetPromise(makeAsset()));
  const Asset asset = makeAsset();
  EXPECT_FALSE(coordinator("com.a")->setAppAssetPromise(asset));
  EXPECT_TRUE(coordinator("com.b")->setAppAssetPromise(asset));
}

// Cancelling.

TEST_P(CoordinatedInstallContract, CancelledPromiseCannotBeAttached) {
  const Asset asset = makeAsset();
  const UserData data = makeUserData();
  EXPECT_TRUE(asset->cancelForReason(reason(), kSync));
  EXPECT_TRUE(data->cancelForReason(reason(), kSync));
  const Coordinator made = coordinator("com.a");
  EXPECT_FALSE(made->setAppAssetPromise(asset));
  EXPECT_FALSE(made->setUserDataPromise(data));
  EXPECT_FALSE(made->setInitialODRAssetPromises({asset}));
  EXPECT_FALSE(makePlaceholder("com.a")->setIconPromise(asset));
  EXPECT_FALSE(made->hasAppAssetPromise() || made->hasUserDataPromise() || made->hasInitialODRAssetPromises());
}

TEST_P(CoordinatedInstallContract, CancelledPromiseCannotBeChanged) {
  const Asset asset = makeAsset();
  asset->setPercentComplete(0.5);
  EXPECT_TRUE(asset->cancelForReason(reason(), kSync));
  asset->setPercentComplete(1);
  asset->setComplete(true);
  asset->setTransferPath(subject().makePackage("com.a", "1.0"));
  EXPECT_EQ(asset->percentComplete(), 0.5);
  EXPECT_FALSE(asset->isComplete());
  EXPECT_EQ(asset->transferPath(), std::nullopt);
}

TEST_P(CoordinatedInstallContract, OnlyTheCreatorCancelsAnAttachedPromise) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  EXPECT_FALSE(asset->cancelForReason(reason(), kStore));
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, CancelledPromiseCompletesNothing) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  EXPECT_TRUE(asset->cancelForReason(reason(), kSync));
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_NE(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, PackageOfARunningInstallCannotBeCancelled) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  EXPECT_FALSE(asset->cancelForReason(reason(), kSync));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, PromiseCanOutliveItsCoordinator) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  asset->setPercentComplete(0.5);
  EXPECT_TRUE(cancel(*made));
  subject().waitUntilIdle();
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(asset->percentComplete(), 0.5);
  EXPECT_FALSE(asset->isComplete());
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_FALSE(coordinator("com.b")->setAppAssetPromise(asset));
}

TEST_P(CoordinatedInstallContract, UnneededPromiseEndsWithItsInstall) {
  const Coordinator made = coordinator("com.a");
  const UserData resource = makeUserData("resource");
  EXPECT_TRUE(made->setInstallOptions(options()));
  EXPECT_TRUE(made->setInitialODRAssetPromises({resource}));
  EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
  const Asset asset = makeAsset();
  EXPECT_TRUE(made->setAppAssetPromise(asset));
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  resource->setPercentComplete(1);
  resource->setComplete(true);
  EXPECT_EQ(resource->percentComplete(), 0);
  EXPECT_FALSE(resource->isComplete());
}

TEST_P(CoordinatedInstallContract, PromiseIsThreadSafe) {
  const Asset asset = makeAsset();
  EXPECT_TRUE(coordinator("com.a")->setAppAssetPromise(asset));
  runOnThreads(4, [&](std::size_t index) {
    for (int round = 0; round < 50; ++round) {
      asset->setPercentComplete(static_cast<double>(index) / 8);
      EXPECT_LT(asset->percentComplete(), 0.5);
    }
  });
  EXPECT_FALSE(asset->isComplete());
}

}  // namespace appsync::test
