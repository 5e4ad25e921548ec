// CoordinatedInstallContract: restarts of the service's process.
#include "kit/contracts/CoordinationListener.h"
#include "kit/contracts/InstallCoordinationContract.h"

namespace appsync::test {

using platform::FileLocation;

TEST_P(CoordinatedInstallContract, CoordinatorSurvivesARestart) {
  {
    const Coordinator made = coordinator("com.a", Kind::restoring);
    EXPECT_TRUE(made->setInstallOptions(options()));
    EXPECT_TRUE(made->setInitialODRAssetPromises({}));
    EXPECT_TRUE(made->setUserDataPromise(makeUserData("com.a-UserData")));
    EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
    EXPECT_TRUE(made->setAppAssetPromiseResponsibleClient(kStore));
    const Coordinator bare = coordinator("com.b", Kind::updating, kStore);
    subject().waitUntilIdle();
  }
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  const Coordinator found = find("com.a", Kind::restoring);
  ASSERT_NE(found, nullptr);
  EXPECT_EQ(found->bundleID(), "com.a");
  EXPECT_EQ(found->creatorIdentifier(), kSync);
  EXPECT_TRUE(found->hasInstallOptions());
  EXPECT_TRUE(found->hasInitialODRAssetPromises());
  EXPECT_FALSE(found->hasAppAssetPromise());
  EXPECT_TRUE(found->hasUserDataPromise());
  EXPECT_TRUE(found->hasPlaceholderPromise());
  EXPECT_EQ(found->appAssetPromiseResponsibleClient(nullptr), kStore);
  EXPECT_EQ(found->coordinatorError(), std::nullopt);
  EXPECT_EQ(stateOf("com.a"), "placeholder");
  const Coordinator bare = find("com.b");
  ASSERT_NE(bare, nullptr);
  EXPECT_EQ(bare->kind(), Kind::updating);
  EXPECT_EQ(bare->creatorIdentifier(), kStore);
  EXPECT_FALSE(bare->hasInstallOptions() || bare->hasInitialODRAssetPromises() || bare->hasUserDataPromise() ||
               bare->hasPlaceholderPromise());
}

TEST_P(CoordinatedInstallContract, PromiseCanBeFulfilledAfterARestart) {
  {
    const Asset asset = prepare(*coordinator("com.a"));
    asset->setPercentComplete(0.5);
    subject().waitUntilIdle();
  }
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  CoordinationListener listener;
  const auto connection = service().initWithMachServiceName("com.corvel.contract.observer", {kSync}, listener);
  const Coordinator found = find("com.a");
  ASSERT_NE(found, nullptr);
  const Asset asset = found->appAssetPromise();
  ASSERT_NE(asset, nullptr);
  EXPECT_EQ(asset->name(), "com.a-Asset");
  EXPECT_EQ(asset->client(), kSync);
  EXPECT_FALSE(asset->isComplete());
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(listener.count("complete com.a"), 1U);
}

TEST_P(CoordinatedInstallContract, CompletePromiseSurvivesARestart) {
  const FileLocation package = subject().makePackage("com.a", "1.0");
  {
    const Coordinator made = coordinator("com.a");
    const Asset asset = makeAsset();
    EXPECT_TRUE(made->setAppAssetPromise(asset));
    deliver(*asset, package);
    EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
    subject().waitUntilIdle();
  }
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  const Coordinator found = find("com.a");
  ASSERT_NE(found, nullptr);
  ASSERT_NE(found->appAssetPromise(), nullptr);
  EXPECT_TRUE(found->appAssetPromise()->isComplete());
  EXPECT_EQ(found->appAssetPromise()->transferPath(), package);
  EXPECT_TRUE(found->setInstallOptions(options()));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_FALSE(subject().exists(package));
}

TEST_P(CoordinatedInstallContract, EndedCoordinatorStaysEndedAfterARestart) {
  {
    install("com.a", "1.0");
    const Coordinator made = coordinator("com.b");
    const Asset asset = prepare(*made);
    subject().waitUntilIdle();
    EXPECT_TRUE(cancel(*made));
    subject().waitUntilIdle();
  }
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(find("com.b"), nullptr);
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(stateOf("com.b"), "absent");
}

TEST_P(CoordinatedInstallContract, CoordinatorCanBeCancelledAfterARestart) {
  {
    const Asset asset = prepare(*coordinator("com.a"));
    subject().waitUntilIdle();
  }
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  const Coordinator found = find("com.a");
  ASSERT_NE(found, nullptr);
  EXPECT_TRUE(cancel(*found));
  subject().waitUntilIdle();
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(CoordinatedInstallContract, OrderOfCoordinatorsSurvivesARestart) {
  {
    const Coordinator oldest = coordinator("com.a", Kind::restoring, kStore);
    const Coordinator youngest = coordinator("com.a", Kind::initiating, kStore);
  }
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  ASSERT_NE(find("com.a"), nullptr);
  EXPECT_EQ(find("com.a")->kind(), Kind::restoring);
}

}  // namespace appsync::test
