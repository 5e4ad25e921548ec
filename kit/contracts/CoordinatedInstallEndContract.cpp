// CoordinatedInstallContract: cancelling and uninstalling.
#include <thread>

#include "kit/contracts/CoordinationListener.h"
#include "kit/contracts/EventCounter.h"
#include "kit/contracts/InstallCoordinationContract.h"

namespace appsync::test {

using platform::FileLocation;
using platform::UserConfirmation;

// Cancelling.

TEST_P(CoordinatedInstallContract, CancellingEndsCoordinatorAndPlaceholder) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  subject().waitUntilIdle();
  EXPECT_TRUE(cancel(*made));
  subject().waitUntilIdle();
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_EQ(made->coordinatorError(), reason());
}

TEST_P(CoordinatedInstallContract, AnyClientCanCancel) {
  const Coordinator made = coordinator("com.a", Kind::initiating, kStore);
  const Coordinator found = find("com.a");
  EXPECT_TRUE(found->cancelForReason(reason(), kSync));
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(made->coordinatorError(), reason());
}

TEST_P(CoordinatedInstallContract, CoordinatorCanBeCancelledOnce) {
  const Coordinator made = coordinator("com.a");
  EXPECT_TRUE(cancel(*made));
  EXPECT_FALSE(made->cancelForReason(Error{"ZTError", 1, "again", nullptr}, kSync));
  EXPECT_EQ(made->coordinatorError(), reason());
}

TEST_P(CoordinatedInstallContract, CancellingAnUpdateLeavesTheInstalledApp) {
  install("com.a", "1.0");
  const Coordinator made = coordinator("com.a", Kind::updating);
  const Asset asset = prepare(*made);
  subject().waitUntilIdle();
  EXPECT_TRUE(cancel(*made));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "1.0");
}

TEST_P(CoordinatedInstallContract, CancellingDeletesTheServicesPackageOnly) {
  const Coordinator waiting = coordinator("com.a");
  const Coordinator loading = coordinator("com.b");
  const FileLocation services = subject().makePackage("com.a", "1.0");
  const FileLocation clients = subject().makePackage("com.b", "1.0");
  const Asset complete = makeAsset("complete");
  const Asset incomplete = makeAsset("incomplete");
  EXPECT_TRUE(waiting->setAppAssetPromise(complete));
  EXPECT_TRUE(loading->setAppAssetPromise(incomplete));
  deliver(*complete, services);
  incomplete->setTransferPath(clients);
  EXPECT_TRUE(cancel(*waiting));
  EXPECT_TRUE(cancel(*loading));
  subject().waitUntilIdle();
  EXPECT_FALSE(subject().exists(services));
  EXPECT_TRUE(subject().exists(clients));
}

TEST_P(CoordinatedInstallContract, CancellingEndsThePromises) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  const UserData data = makeUserData();
  EXPECT_TRUE(made->setUserDataPromise(data));
  EXPECT_TRUE(cancel(*made));
  data->setComplete(true);
  EXPECT_FALSE(data->isComplete());
  const Coordinator next = coordinator("com.a");
  EXPECT_FALSE(next->setUserDataPromise(data));
  EXPECT_FALSE(next->setAppAssetPromise(asset));
}

TEST_P(CoordinatedInstallContract, CancellingOneKindLeavesOtherKinds) {
  const Coordinator made = coordinator("com.a");
  const Coordinator other = coordinator("com.a", Kind::restoring);
  EXPECT_TRUE(cancel(*made));
  EXPECT_EQ(other->coordinatorError(), std::nullopt);
  ASSERT_NE(find("com.a"), nullptr);
  EXPECT_EQ(find("com.a")->kind(), Kind::restoring);
}

TEST_P(CoordinatedInstallContract, UserCanCancel) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  subject().waitUntilIdle();
  subject().cancelByUser("com.a");
  subject().waitUntilIdle();
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_NE(made->coordinatorError(), std::nullopt);
}

// Uninstalling.

namespace {

/// The result of an uninstall.
struct Uninstalled {
  EventCounter completions;
  std::optional<Error> error;
  std::thread::id thread;

  [[nodiscard]] platform::InstallCoordination::UninstallCompletion completion() {
    return [this](const std::optional<Error>& outcome) {
      error = outcome;
      thread = std::this_thread::get_id();
      completions.add();
    };
  }
};

}  // namespace

TEST_P(CoordinatedInstallContract, UninstallingRemovesTheAppThenCompletes) {
  install("com.a", "1.0");
  Uninstalled uninstalled;
  service().uninstallApp("com.a", UserConfirmation::skip, uninstalled.completion());
  ASSERT_TRUE(uninstalled.completions.waitFor(1));
  EXPECT_EQ(uninstalled.error, std::nullopt);
  EXPECT_NE(uninstalled.thread, std::this_thread::get_id());
  EXPECT_EQ(stateOf("com.a"), "absent");
  const auto list = subject().uninstalledApps().lookupUninstalled();
  ASSERT_TRUE(list);
  EXPECT_NE(list->find("com.a"), nullptr);
  subject().waitUntilIdle();
  EXPECT_EQ(uninstalled.completions.count(), 1U);
}

TEST_P(CoordinatedInstallContract, UninstallingCancelsTheAppsCoordinatorsFirst) {
  install("com.a", "1.0");
  const Coordinator updating = coordinator("com.a", Kind::updating);
  const Coordinator foreign = coordinator("com.a", Kind::restoring, kStore);
  const Coordinator other = coordinator("com.b");
  const Asset asset = prepare(*updating);
  Uninstalled uninstalled;
  service().uninstallApp("com.a", UserConfirmation::skip, uninstalled.completion());
  ASSERT_TRUE(uninstalled.completions.waitFor(1));
  EXPECT_EQ(uninstalled.error, std::nullopt);
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_NE(updating->coordinatorError(), std::nullopt);
  EXPECT_NE(foreign->coordinatorError(), std::nullopt);
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_NE(find("com.b"), nullptr);
}

TEST_P(CoordinatedInstallContract, UninstallingReportsCancellationByTheUser) {
  CoordinationListener listener;
  const auto connection = service().initWithMachServiceName("com.corvel.contract.observer", {kSync}, listener);
  const Coordinator made = coordinator("com.a");
  Uninstalled uninstalled;
  service().uninstallApp("com.a", UserConfirmation::skip, uninstalled.completion());
  ASSERT_TRUE(uninstalled.completions.waitFor(1));
  subject().waitUntilIdle();
  ASSERT_EQ(listener.events().size(), 1U);
  EXPECT_TRUE(listener.events().front().starts_with("cancelled com.a by 2 for ")) << listener.events().front();
}

TEST_P(CoordinatedInstallContract, UninstallingAPlaceholderListsNothingAsRemoved) {
  const Coordinator made = coordinator("com.a");
  const Asset asset = prepare(*made);
  subject().waitUntilIdle();
  Uninstalled uninstalled;
  service().uninstallApp("com.a", UserConfirmation::skip, uninstalled.completion());
  ASSERT_TRUE(uninstalled.completions.waitFor(1));
  EXPECT_EQ(uninstalled.error, std::nullopt);
  EXPECT_EQ(stateOf("com.a"), "absent");
  const auto list = subject().uninstalledApps().lookupUninstalled();
  EXPECT_TRUE(!list || list->find("com.a") == nullptr);
}

TEST_P(CoordinatedInstallContract, UninstallingAnUnknownAppCompletesOnce) {
  Uninstalled uninstalled;
  service().uninstallApp("com.unknown", UserConfirmation::skip, uninstalled.completion());
  ASSERT_TRUE(uninstalled.completions.waitFor(1));
  subject().waitUntilIdle();
  EXPECT_EQ(uninstalled.completions.count(), 1U);
}

TEST_P(CoordinatedInstallContract, UninstallCompletesBeforeTheServiceEnds) {
  auto another = GetParam().make();
  Uninstalled uninstalled;
  another->coordination().uninstallApp("com.unknown", UserConfirmation::skip, uninstalled.completion());
  another.reset();
  EXPECT_EQ(uninstalled.completions.count(), 1U);
}

TEST_P(CoordinatedInstallContract, UninstallCompletionCanCallTheService) {
  install("com.a", "1.0");
  install("com.b", "1.0");
  Uninstalled second;
  service().uninstallApp("com.a", UserConfirmation::skip, [&](const std::optional<Error>&) {
    EXPECT_NE(coordinator("com.a"), nullptr);
    service().uninstallApp("com.b", UserConfirmation::skip, second.completion());
  });
  ASSERT_TRUE(second.completions.waitFor(1));
  EXPECT_EQ(second.error, std::nullopt);
  EXPECT_EQ(stateOf("com.b"), "absent");
  EXPECT_NE(find("com.a"), nullptr);
}

}  // namespace appsync::test
