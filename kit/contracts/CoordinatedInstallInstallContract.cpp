// CoordinatedInstallContract: installs.
#include "kit/contracts/InstallCoordinationContract.h"

namespace appsync::test {

using platform::FileLocation;
using platform::PlaceholderLookup;
using platform::TSInstallType;

TEST_P(CoordinatedInstallContract, FulfilledPromisesInstallTheApp) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
  const FileLocation package = subject().makePackage("com.a", "2.0");
  deliver(*asset, package);
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "2.0");
  EXPECT_EQ(subject().registry().recordForIdentifier("com.a", PlaceholderLookup::off)->installType(),
            TSInstallType::Restore);
  EXPECT_FALSE(subject().exists(package));
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(made->coordinatorError(), std::nullopt);
}

TEST_P(CoordinatedInstallContract, EndedInstallCannotBeChanged) {
  const Coordinator made = coordinator("com.a");
  deliver(*prepare(*made), subject().makePackage("com.a", "2.0"));
  subject().waitUntilIdle();
  EXPECT_FALSE(cancel(*made));
  EXPECT_FALSE(made->setUserDataPromise(makeUserData()));
  EXPECT_FALSE(made->setAppAssetPromiseResponsibleClient(kStore));
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(made->coordinatorError(), std::nullopt);
}

TEST_P(CoordinatedInstallContract, StoresStoreMetadataWithTheApp) {
  const Coordinator made = coordinator("com.a");
  platform::InstallOptions withMetadata = options();
  withMetadata.setStoreMetadata(platform::StoreMetadata::initWithDictionary({{"itemName", "Kept"}}));
  EXPECT_TRUE(made->setInstallOptions(withMetadata));
  EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
  const Asset asset = makeAsset();
  EXPECT_TRUE(made->setAppAssetPromise(asset));
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  ASSERT_EQ(stateOf("com.a"), "installed");
  const std::optional<plist::Dictionary> kept = subject().storeMetadataOf("com.a");
  if (!kept) GTEST_SKIP() << "the subject cannot read store metadata";
  ASSERT_NE(kept->find("itemName"), nullptr);
  EXPECT_EQ(kept->find("itemName")->string(), "Kept");
}

// Preconditions of an install.

TEST_P(CoordinatedInstallContract, InstallWaitsForThePackage) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  asset->setTransferPath(subject().makePackage("com.a", "1.0"));
  asset->setPercentComplete(1);
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
  asset->setComplete(true);
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, InstallWaitsForInstallOptions) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = makeAsset();
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  EXPECT_TRUE(made->setAppAssetPromise(asset));
  EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
  EXPECT_TRUE(made->setInstallOptions(options()));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, InstallWaitsForThePlaceholder) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = makeAsset();
  EXPECT_TRUE(made->setInstallOptions(options()));
  EXPECT_TRUE(made->setAppAssetPromise(asset));
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, InstallWaitsForPromisedUserData) {
  const Coordinator made = coordinator("com.a");
  const UserData data = makeUserData();
  EXPECT_TRUE(made->setUserDataPromise(data));
  deliver(*prepare(*made), subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
  data->setPercentComplete(1);
  data->setComplete(true);
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, InstallsWithUnconfiguredPlaceholder) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = makeAsset();
  EXPECT_TRUE(made->setInstallOptions(options()));
  EXPECT_TRUE(made->setAppAssetPromise(asset));
  EXPECT_TRUE(made->setPlaceholderPromise(makePlaceholder("com.a")));
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, InstallsThePackageOfTheResponsibleClient) {
  {
    const Coordinator made = coordinator("com.a", Kind::restoring);
    const UserData data = makeUserData();
    data->setComplete(true);
    EXPECT_TRUE(made->setUserDataPromise(data));
    EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
    EXPECT_TRUE(made->setAppAssetPromiseResponsibleClient(kStore));
  }
  const Coordinator found = find("com.a", Kind::restoring, kStore);
  ASSERT_NE(found, nullptr);
  const Asset asset = makeAsset("of the store", kStore);
  EXPECT_TRUE(found->setAppAssetPromise(asset));
  deliver(*asset, subject().makePackage("com.a", "3.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "3.0");
  EXPECT_EQ(find("com.a"), nullptr);
}

// Updates.

TEST_P(CoordinatedInstallContract, AppIsUsableUntilItsUpdateIsInstalled) {
  install("com.a", "1.0");
  const Coordinator made = coordinator("com.a", Kind::updating);
  const Asset asset = prepare(*made);
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "both");
  EXPECT_EQ(versionOf("com.a"), "1.0");
  deliver(*asset, subject().makePackage("com.a", "2.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "2.0");
}

TEST_P(CoordinatedInstallContract, FailedUpdateLeavesAppUnchanged) {
  install("com.a", "1.0");
  const Coordinator made = coordinator("com.a", Kind::updating);
  deliver(*prepare(*made), subject().makeDamagedPackage("com.a"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "1.0");
  EXPECT_NE(made->coordinatorError(), std::nullopt);
}

// Failures.

TEST_P(CoordinatedInstallContract, FailedInstallSetsErrorAndLeavesNothing) {
  const Coordinator made = coordinator("com.a");
  const FileLocation package = subject().makeDamagedPackage("com.a");
  deliver(*prepare(*made), package);
  subject().waitUntilIdle();
  EXPECT_NE(made->coordinatorError(), std::nullopt);
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_FALSE(subject().exists(package));
}

TEST_P(CoordinatedInstallContract, PackageOfAnotherAppFailsTheInstall) {
  const Coordinator made = coordinator("com.a");
  deliver(*prepare(*made), subject().makePackage("com.b", "1.0"));
  subject().waitUntilIdle();
  EXPECT_NE(made->coordinatorError(), std::nullopt);
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_EQ(stateOf("com.b"), "absent");
}

TEST_P(CoordinatedInstallContract, MissingPackageFailsTheInstall) {
  const Coordinator made = coordinator("com.a");
  FileLocation missing = subject().makePackage("com.a", "1.0");
  missing.path += ".missing";
  deliver(*prepare(*made), missing);
  subject().waitUntilIdle();
  EXPECT_NE(made->coordinatorError(), std::nullopt);
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(CoordinatedInstallContract, CompletePromiseWithoutPathFailsTheInstall) {
  const Coordinator made = coordinator("com.a");
  prepare(*made)->setComplete(true);
  subject().waitUntilIdle();
  EXPECT_NE(made->coordinatorError(), std::nullopt);
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(CoordinatedInstallContract, FailedInstallLeavesOtherInstallsRunning) {
  const Coordinator bad = coordinator("com.bad");
  const Coordinator good = coordinator("com.good");
  deliver(*prepare(*bad), subject().makeDamagedPackage("com.bad"));
  deliver(*prepare(*good), subject().makePackage("com.good", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.bad"), "absent");
  EXPECT_EQ(stateOf("com.good"), "installed");
}

TEST_P(CoordinatedInstallContract, FailedInstallCanBeRetried) {
  deliver(*prepare(*coordinator("com.a")), subject().makeDamagedPackage("com.a"));
  subject().waitUntilIdle();
  install("com.a", "1.0");
}

// Ownership of files.

TEST_P(CoordinatedInstallContract, ServiceLeavesTheIconFile) {
  const FileLocation icon = subject().makeIcon();
  const Coordinator made = coordinator("com.a");
  const Asset iconPromise = service().makePromisedTransferToPath("icon", kSync, icon, 9);
  iconPromise->setComplete(true);
  const AppPlaceholder placeholder = makePlaceholder("com.a");
  EXPECT_TRUE(placeholder->setIconPromise(iconPromise));
  EXPECT_TRUE(placeholder->setConfigurationComplete());
  EXPECT_TRUE(made->setPlaceholderPromise(placeholder));
  EXPECT_TRUE(made->setInstallOptions(options()));
  const Asset asset = makeAsset();
  EXPECT_TRUE(made->setAppAssetPromise(asset));
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_TRUE(subject().exists(icon));
}

}  // namespace appsync::test
