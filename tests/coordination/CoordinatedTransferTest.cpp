// Passing on to a coordinator how its app's package comes, or that it does not.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::CoordinatorKind;
using Strings = std::vector<std::string>;

class CoordinatedTransfer : public CoordinationFixture {
 protected:
  void SetUp() override {
    CoordinationFixture::SetUp();
    platform.files.put(kReceivedPackage, "package");
    asset.setPath(std::string(kReceivedPackage));
    asset.setDownloadProgress(0.25);
    asset.setInstallProgress(0.5);
  }

  [[nodiscard]] LogLines lookedUp(const std::string& kind) const {
    return {called("transactionLog.logStep 3 com.a y Create coordinator"),
            called("installCoordination.coordinatorForApp " + kind + " com.a find"),
            called("coordinator.creatorIdentifier com.a"),
            logged("Created " + kind + " coordinator <" + kind + " coordinator com.a> (createIfNotExisting:0, " +
                   "existingApp:" + (kind == "updating" ? "1" : "0") + ") for com.a with error (null)"),
            called("transactionLog.logStep 3 com.a y Finished creating coordinator"),
            called("coordinator.coordinatorError com.a")};
  }

  /// After the look-up, these.
  testing::AssertionResult took(LogLines steps, const std::string& kind = "initiating") {
    LogLines expected = lookedUp(kind);
    expected.insert(expected.end(), steps.begin(), steps.end());
    return sameLines(expected, platform.log.lines());
  }

  [[nodiscard]] FakePromise package() const { return platform.coordination.promise("com.a-Asset").value(); }
};

using CoordinatedProgress = CoordinatedTransfer;
using CoordinatedCompletion = CoordinatedTransfer;

/// Of a sync.
class CoordinatedEnd : public CoordinationFixture {};

TEST_F(CoordinatedProgress, TheDownloadIsShownAndTheInstallOnlyLogged) {
  platform.coordination.add(prepared());
  EXPECT_TRUE(makeTracedClient().updateTransferProgressForApp(asset, false));
  EXPECT_TRUE(took({called("coordinator.appAssetPromise com.a"), called("promise.isComplete com.a-Asset"),
                    logged("Updating download progress: 0.250000 install progress:0.500000 for com.a"),
                    called("promise.setPercentComplete com.a-Asset 0.25")}));
}

TEST_F(CoordinatedProgress, AnExistingAppsUpdateIsLookedUp) {
  platform.coordination.add(prepared("com.a", CoordinatorKind::updating));
  EXPECT_TRUE(makeTracedClient().updateTransferProgressForApp(asset, true));
  EXPECT_TRUE(platform.journal.contains("installCoordination.coordinatorForApp updating com.a find"));
}

TEST_F(CoordinatedProgress, WithoutACoordinatorNothingIsShown) {
  EXPECT_FALSE(makeClient().updateTransferProgressForApp(asset, false));
  EXPECT_TRUE(platform.log.lines().empty());
  EXPECT_TRUE(platform.coordination.coordinators().empty());
}

TEST_F(CoordinatedProgress, AnotherClientsCoordinatorIsLeftAlone) {
  platform.coordination.add(prepared().madeBy(kStore));
  EXPECT_FALSE(makeClient().updateTransferProgressForApp(asset, false));
  EXPECT_EQ(platform.journal.count("promise."), 0U);
}

TEST_F(CoordinatedProgress, ACoordinatorWithAnErrorIsLeftAlone) {
  platform.coordination.add(prepared().withError(error));
  EXPECT_FALSE(makeTracedClient().updateTransferProgressForApp(asset, false));
  EXPECT_TRUE(took({}));
}

TEST_F(CoordinatedProgress, APackageThatIsThereHasNoProgress) {
  platform.coordination.add(prepared().withAppAsset(completeAsset()));
  EXPECT_FALSE(makeTracedClient().updateTransferProgressForApp(asset, false));
  EXPECT_TRUE(took({called("coordinator.appAssetPromise com.a"), called("promise.isComplete com.a-Asset"),
                    logged("Asset promise is already satisfied for com.a")}));
}

TEST_F(CoordinatedProgress, AMissingPromiseIsMadeWithTheAssetsPath) {
  platform.coordination.add(FakeCoordinator::of("com.a"));
  EXPECT_TRUE(makeTracedClient().updateTransferProgressForApp(asset, false));
  EXPECT_TRUE(
      took({called("coordinator.appAssetPromise com.a"),
            called("installCoordination.makePromisedTransferToPath com.a-Asset 0 " + std::string(kReceivedPackage)),
            called("coordinator.setAppAssetPromise com.a com.a-Asset"),
            logged("Added app asset promise to coordinator for 'com.a'"),
            logged("Updating download progress: 0.250000 install progress:0.500000 for com.a"),
            called("promise.setPercentComplete com.a-Asset 0.25")}));
}

TEST_F(CoordinatedProgress, APromiseThatCannotBeMadeIsStillASuccess) {
  platform.coordination.add(FakeCoordinator::of("com.a"));
  platform.coordination.failures.failNext("installCoordination.makePromisedTransferToPath", "com.a-Asset", error);
  EXPECT_TRUE(makeClient().updateTransferProgressForApp(asset, false));
  EXPECT_TRUE(said("Updating download progress: 0.250000 install progress:0.500000 for com.a"));
}

TEST_F(CoordinatedCompletion, AReceivedPackageFulfilsThePromise) {
  platform.coordination.add(prepared());
  makeTracedClient().transferCompleteForApp(asset, std::nullopt, false);
  EXPECT_TRUE(took({called("coordinator.appAssetPromise com.a"), called("promise.isComplete com.a-Asset"),
                    called("promise.setTransferPath com.a-Asset " + std::string(kReceivedPackage)),
                    logged("Satisfying asset promise for com.a"), called("promise.setPercentComplete com.a-Asset 1"),
                    called("promise.setComplete com.a-Asset")}));
  EXPECT_TRUE(package().isComplete);
}

TEST_F(CoordinatedCompletion, AnUpdatesPromiseIsFulfilledOnTheUpdatingCoordinator) {
  platform.coordination.add(prepared("com.a", CoordinatorKind::updating));
  makeTracedClient().transferCompleteForApp(asset, std::nullopt, true);
  EXPECT_TRUE(package().isComplete);
}

TEST_F(CoordinatedCompletion, AMissingPromiseIsMadeWithThePathAndFulfilled) {
  platform.coordination.add(FakeCoordinator::of("com.a"));
  makeTracedClient().transferCompleteForApp(asset, std::nullopt, false);
  EXPECT_EQ(package().transferPath, platform::FileLocation::file(kReceivedPackage));
  EXPECT_TRUE(package().isComplete);
  EXPECT_EQ(platform.journal.count("promise.setTransferPath"), 0U);
}

TEST_F(CoordinatedCompletion, APromiseThatCannotBeMadeIsOnlyLogged) {
  platform.coordination.add(FakeCoordinator::of("com.a"));
  platform.coordination.failures.failNext("coordinator.setAppAssetPromise", "com.a", error);
  makeClient().transferCompleteForApp(asset, std::nullopt, false);
  EXPECT_TRUE(said("Satisfying asset promise for com.a"));
  EXPECT_TRUE(platform.coordination.abandoned().empty());
}

TEST_F(CoordinatedCompletion, APackageThatIsThereAlreadyIsOnlyLogged) {
  platform.coordination.add(prepared().withAppAsset(completeAsset()));
  makeTracedClient().transferCompleteForApp(asset, std::nullopt, false);
  EXPECT_TRUE(took({called("coordinator.appAssetPromise com.a"), called("promise.isComplete com.a-Asset"),
                    logged("Asset promise is already satisfied for com.a")}));
}

TEST_F(CoordinatedCompletion, AFailedTransferCancelsTheCoordinatorWithWhatAPersonCanBeShown) {
  platform.coordination.add(prepared());
  const Error lost{"ZTError", 7, "lost the host", nullptr};
  makeTracedClient().transferCompleteForApp(asset, lost, false);
  EXPECT_TRUE(took({called("installCoordination.createUserPresentableError 1"),
                    called("coordinator.cancelForReason com.a InstallCoordinationError 1 3")}));
  ASSERT_TRUE(cancellation());
  ASSERT_NE(cancellation()->reason.underlying, nullptr);
  EXPECT_EQ(*cancellation()->reason.underlying, lost);
  EXPECT_EQ(cancellation()->client, kSync);
}

TEST_F(CoordinatedCompletion, WithoutAUsableCoordinatorNothingHappens) {
  AppsClient& client = makeClient();
  client.transferCompleteForApp(asset, std::nullopt, false);
  client.transferCompleteForApp(asset, error, false);
  platform.coordination.add(prepared().withError(error));
  client.transferCompleteForApp(asset, std::nullopt, false);
  client.transferCompleteForApp(asset, error, false);
  EXPECT_EQ(platform.journal.count("promise."), 0U);
  EXPECT_EQ(platform.journal.count("coordinator.cancelForReason"), 0U);
  EXPECT_EQ(platform.journal.count("installCoordination.createUserPresentableError"), 0U);
}

TEST_F(CoordinatedCompletion, AnotherClientsCoordinatorIsNeitherFulfilledNorCancelled) {
  platform.coordination.add(prepared().madeBy(kStore));
  AppsClient& client = makeClient();
  client.transferCompleteForApp(asset, std::nullopt, false);
  client.transferCompleteForApp(asset, error, false);
  EXPECT_FALSE(package().isComplete);
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
}

TEST_F(CoordinatedEnd, AfterAFailedSyncWhatIsOutstandingIsCancelledInOrder) {
  platform.coordination.add(prepared("com.b", CoordinatorKind::updating));
  platform.coordination.add(prepared("com.a"));
  AppsClient& client = makeTracedClient();
  client.assetSyncFinishedWithStatus(false, {"com.a", "com.b"});
  const std::string reason = description(Error{"ZTError", 30, {}, nullptr});
  EXPECT_TRUE(sameLines({called("installCoordination.coordinatorForApp any com.a find"),
                         logged("Cancelling coordinator with error " + reason + " for com.a"),
                         called("coordinator.cancelForReason com.a ZTError 30 3"),
                         called("installCoordination.coordinatorForApp any com.b find"),
                         logged("Cancelling coordinator with error " + reason + " for com.b"),
                         called("coordinator.cancelForReason com.b ZTError 30 3")},
                        platform.log.lines()));
  EXPECT_TRUE(platform.coordination.coordinators().empty());
}

TEST_F(CoordinatedEnd, AfterASuccessfulSyncNothingIsCancelled) {
  platform.coordination.add(prepared());
  makeClient().assetSyncFinishedWithStatus(true, {"com.a"});
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(CoordinatedEnd, AnAppWhoseCoordinatorHasGoneIsPassedOver) {
  platform.coordination.add(prepared("com.b"));
  makeClient().assetSyncFinishedWithStatus(false, {"com.a", "com.b"});
  EXPECT_EQ(platform.journal.lines({"coordinator."}), Strings{"coordinator.cancelForReason com.b ZTError 30 3"});
}

TEST_F(CoordinatedEnd, TheCoordinatorsCreatorIsNotAskedAbout) {
  platform.coordination.add(prepared().madeBy(kStore));
  makeClient().assetSyncFinishedWithStatus(false, {"com.a"});
  EXPECT_TRUE(platform.coordination.coordinators().empty());
  EXPECT_EQ(platform.journal.count("coordinator.creatorIdentifier"), 0U);
}

}  // namespace
}  // namespace appsync::test
