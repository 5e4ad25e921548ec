#include <thread>
#include <vector>

#include <gtest/gtest-spi.h>
#include <gtest/gtest.h>

#include "kit/fakes/FakeInstallCoordination.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using platform::IfMissing;
using platform::InstallCoordinator;

namespace {

constexpr std::string_view kPath = "/staging/a.zip";
const Error kReason{"ZTError", 30, {}, nullptr};

/// Records callbacks and their threads.
class Listener final : public platform::InstallObserverDelegate {
 public:
  void coordinatorDidInstallPlaceholder(InstallCoordinator& coordinator) override { note("placeholder", coordinator); }
  void coordinatorDidCompleteSuccessfully(InstallCoordinator& coordinator) override { note("complete", coordinator); }
  void coordinatorShouldPrioritize(InstallCoordinator& coordinator) override { note("prioritize", coordinator); }
  void coordinatorShouldPause(InstallCoordinator& coordinator) override { note("pause", coordinator); }
  void coordinatorShouldResume(InstallCoordinator& coordinator) override { note("resume", coordinator); }
  void coordinatorShouldBeginRestoringUserData(InstallCoordinator& coordinator) override { note("data", coordinator); }
  void coordinatorCanceledWithReason(InstallCoordinator& coordinator, const Error& reason,
                                     ClientIdentity client) override {
    note("cancelled by " + std::to_string(static_cast<std::uint64_t>(client)) + " for " + std::to_string(reason.code),
         coordinator);
  }

  std::vector<std::string> events;
  std::thread::id thread;

 private:
  void note(const std::string& what, InstallCoordinator& coordinator) {
    const std::optional<Error> error = coordinator.coordinatorError();
    events.push_back(what + " " + coordinator.bundleID().value_or("(none)") + (error ? " with error" : ""));
    thread = std::this_thread::get_id();
  }
};

class FakeInstallCoordinationTest : public testing::Test {
 protected:
  [[nodiscard]] std::shared_ptr<InstallCoordinator> make(CoordinatorKind kind = CoordinatorKind::initiating) {
    return service.coordinatorForApp(kind, "com.a", ClientIdentity::CXClientSync, IfMissing::create, nullptr, nullptr);
  }

  /// Sets everything that the coordinator needs except the package.
  [[nodiscard]] std::shared_ptr<platform::PromisedTransferToPath> prepare(InstallCoordinator& coordinator) {
    platform::InstallOptions options;
    options.setInstallType(platform::TSInstallType::Sync);
    EXPECT_TRUE(coordinator.setInstallOptions(options));
    const auto placeholder = service.initAppPlaceholder("A", "com.a", platform::TSInstallType::Sync, kSync);
    EXPECT_TRUE(placeholder->setConfigurationComplete());
    EXPECT_TRUE(coordinator.setPlaceholderPromise(placeholder));
    auto asset = service.makePromisedTransferToPath("com.a-Asset", kSync, std::nullopt, 0);
    EXPECT_TRUE(coordinator.setAppAssetPromise(asset));
    return asset;
  }

  void deliver(platform::PromisedTransferToPath& asset) {
    platform.files.put(kPath, packageOf("com.a", "2.0"));
    asset.setTransferPath({std::string(kPath), false});
    asset.setComplete(true);
  }

  static constexpr ClientIdentity kSync = ClientIdentity::CXClientSync;
  FakePlatform platform;
  FakeInstallCoordination& service = platform.coordination;
};

}  // namespace

TEST_F(FakeInstallCoordinationTest, JournalsCallsWithTheirSubjects) {
  const auto coordinator = make();
  const auto asset = prepare(*coordinator);
  asset->setPercentComplete(0.5);
  deliver(*asset);
  coordinator->cancelForReason(kReason, kSync).ignore();
  EXPECT_EQ(
      platform.journal.lines({"installCoordination.", "coordinator.", "placeholder.", "promise."}),
      (std::vector<std::string>{
          "installCoordination.coordinatorForApp initiating com.a create", "coordinator.setInstallOptions com.a",
          "installCoordination.initAppPlaceholder com.a 4 A", "placeholder.setConfigurationComplete com.a",
          "coordinator.setPlaceholderPromise com.a", "installCoordination.makePromisedTransferToPath com.a-Asset 0",
          "coordinator.setAppAssetPromise com.a com.a-Asset", "promise.setPercentComplete com.a-Asset 0.5",
          "promise.setTransferPath com.a-Asset /staging/a.zip", "promise.setComplete com.a-Asset",
          "coordinator.cancelForReason com.a ZTError 30 3"}));
}

TEST_F(FakeInstallCoordinationTest, HasNoAutomaticActionsByDefault) {
  const auto coordinator = make();
  deliver(*prepare(*coordinator));
  service.waitUntilIdle();
  EXPECT_EQ(service.coordinators().size(), 1U);
  EXPECT_TRUE(platform.registry.identifiers().empty());
}

TEST_F(FakeInstallCoordinationTest, AutomaticModeInstallsThePackage) {
  service.installAutomatically();
  Listener listener;
  const auto connection = service.initWithMachServiceName("name", {kSync}, listener);
  const auto coordinator = make();
  const auto asset = prepare(*coordinator);
  service.waitUntilIdle();
  ASSERT_TRUE(platform.registry.app("com.a"));
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
  EXPECT_EQ(platform.registry.app("com.a")->installType, platform::TSInstallType::Sync);
  deliver(*asset);
  service.waitUntilIdle();
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
  EXPECT_FALSE(platform.registry.app("com.a")->isPlaceholder);
  EXPECT_EQ(platform.registry.app("com.a")->version, "2.0");
  EXPECT_FALSE(platform.files.has(kPath));
  EXPECT_TRUE(service.coordinators().empty());
  EXPECT_EQ(listener.events, (std::vector<std::string>{"placeholder com.a", "complete com.a"}));
  EXPECT_NE(listener.thread, std::this_thread::get_id());
  EXPECT_EQ(platform.journal.count("registry."), 0U);
}

TEST_F(FakeInstallCoordinationTest, FailedInstallHasTheInstallersError) {
  service.installAutomatically();
  Listener listener;
  const auto connection = service.initWithMachServiceName("name", {kSync}, listener);
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", installerError("no room"));
  const auto coordinator = make();
  deliver(*prepare(*coordinator));
  service.waitUntilIdle();
  EXPECT_TRUE(platform.registry.identifiers().empty());
  EXPECT_FALSE(platform.files.has(kPath));
  ASSERT_EQ(service.endedCoordinators().size(), 1U);
  EXPECT_EQ(service.endedCoordinators()[0].error, installerError("no room"));
  EXPECT_EQ(listener.events, (std::vector<std::string>{"placeholder com.a", "complete com.a with error"}));
}

TEST_F(FakeInstallCoordinationTest, ShowingAPlaceholderCanFail) {
  service.installAutomatically();
  Listener listener;
  const auto connection = service.initWithMachServiceName("name", {kSync}, listener);
  service.failures.failNext(std::string(kShowingPlaceholder), "com.a", kReason);
  const auto coordinator = make();
  const auto asset = prepare(*coordinator);
  service.waitUntilIdle();
  EXPECT_EQ(listener.events, std::vector<std::string>{"placeholder com.a with error"});
  EXPECT_TRUE(platform.registry.identifiers().empty());
}

TEST_F(FakeInstallCoordinationTest, ClosedGateHoldsAllActions) {
  service.installAutomatically();
  service.gate.close();
  const auto coordinator = make();
  deliver(*prepare(*coordinator));
  service.gate.waitUntilStopped(1);
  EXPECT_TRUE(platform.registry.identifiers().empty());
  service.runUntilIdle();
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
}

TEST_F(FakeInstallCoordinationTest, RunningInstallIsNotCancelled) {
  service.installAutomatically();
  const auto coordinator = make();
  const auto asset = prepare(*coordinator);
  service.waitUntilIdle();
  service.gate.close();
  deliver(*asset);
  service.gate.waitUntilStopped(1);
  EXPECT_EQ(service.coordinator("com.a")->stage, FakeCoordinatorStage::installing);
  EXPECT_FALSE(coordinator->cancelForReason(kReason, kSync));
  EXPECT_FALSE(asset->cancelForReason(kReason, kSync));
  service.runUntilIdle();
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
}

TEST_F(FakeInstallCoordinationTest, TestsTriggerEvents) {
  Listener listener;
  const auto connection = service.initWithMachServiceName("name", {kSync}, listener);
  service.add(FakeCoordinator::of("com.a"));
  service.didInstallPlaceholder("com.a");
  service.prioritize("com.a");
  service.pause("com.a");
  service.resume("com.a");
  service.beginRestoringUserData("com.a");
  service.waitUntilIdle();
  service.complete("com.a", kReason);
  service.waitUntilIdle();
  EXPECT_EQ(listener.events, (std::vector<std::string>{"placeholder com.a", "prioritize com.a", "pause com.a",
                                                       "resume com.a", "data com.a", "complete com.a with error"}));
  EXPECT_TRUE(service.coordinators().empty());
}

TEST_F(FakeInstallCoordinationTest, CallbacksCanRunOnTheCallingThread) {
  Listener listener;
  const auto connection = service.initWithMachServiceName("name", {kSync}, listener);
  service.add(FakeCoordinator::of("com.a").withoutIdentifier());
  service.cancelByUser("com.a", CallbackOn::callingThread);
  EXPECT_EQ(listener.events, std::vector<std::string>{"cancelled by 2 for 2 (none) with error"});
  EXPECT_EQ(listener.thread, std::this_thread::get_id());
}

TEST_F(FakeInstallCoordinationTest, ReturnsItsContents) {
  FakePromise asset;
  asset.name = "com.a-Asset";
  asset.isComplete = true;
  service.add(FakeCoordinator::of("com.a", CoordinatorKind::restoring)
                  .madeBy(ClientIdentity::CXClientBazaarly)
                  .withAppAsset(asset)
                  .withoutODRAssets());
  const auto coordinator =
      service.coordinatorForApp(CoordinatorKind::restoring, "com.a", kSync, IfMissing::create, nullptr, nullptr);
  EXPECT_EQ(coordinator->creatorIdentifier(), ClientIdentity::CXClientBazaarly);
  EXPECT_TRUE(coordinator->hasInitialODRAssetPromises());
  EXPECT_FALSE(coordinator->hasInstallOptions());
  EXPECT_TRUE(coordinator->appAssetPromise()->isComplete());
  EXPECT_TRUE(service.promise("com.a-Asset")->isAttached);
  EXPECT_EQ(service.coordinator("com.a")->kind, CoordinatorKind::restoring);
}

TEST_F(FakeInstallCoordinationTest, CallsFailOnceOrAlwaysAsPlanned) {
  service.failures.failNext("coordinator.setInstallOptions", "com.a", kReason);
  service.failures.failAlways("installCoordination.initAppPlaceholder", "com.a", kReason);
  const auto coordinator = make();
  EXPECT_EQ(coordinator->setInstallOptions({}).failure(), kReason);
  EXPECT_FALSE(coordinator->hasInstallOptions());
  EXPECT_TRUE(coordinator->setInstallOptions({}));
  EXPECT_EQ(service.initAppPlaceholder("A", "com.a", platform::TSInstallType::Sync, kSync), nullptr);
}

TEST_F(FakeInstallCoordinationTest, JournalHookFailsEveryOperation) {
  const auto coordinator = make();
  const auto asset = prepare(*coordinator);
  platform.journal.setHook([](std::string_view, std::string_view) { return std::optional<Error>(kReason); });
  std::optional<Error> error;
  EXPECT_EQ(service.coordinatorForApp(CoordinatorKind::any, "com.a", kSync, IfMissing::findNothing, nullptr, &error),
            nullptr);
  EXPECT_EQ(error, kReason);
  EXPECT_FALSE(coordinator->hasAppAssetPromise());
  EXPECT_EQ(coordinator->appAssetPromise(), nullptr);
  EXPECT_EQ(coordinator->bundleID(), std::nullopt);
  EXPECT_EQ(coordinator->setInitialODRAssetPromises({}).failure(), kReason);
  EXPECT_EQ(coordinator->cancelForReason({}, kSync).failure(), kReason);
  asset->setComplete(true);
  platform.journal.setHook(nullptr);
  EXPECT_FALSE(asset->isComplete());
  EXPECT_TRUE(coordinator->hasAppAssetPromise());
}

TEST_F(FakeInstallCoordinationTest, ListsAbandonedObjects) {
  const auto coordinator = make();
  const auto asset = prepare(*coordinator);
  EXPECT_TRUE(service.abandoned().empty());
  const auto icon = service.makePromisedTransferToPath("com.a-Icon", kSync, std::nullopt, 0);
  const auto placeholder = service.initAppPlaceholder("B", "com.b", platform::TSInstallType::Sync, kSync);
  EXPECT_EQ(service.abandoned(), (std::vector<std::string>{"com.a-Icon", "com.b"}));
  EXPECT_TRUE(icon->cancelForReason(kReason, kSync));
  EXPECT_TRUE(placeholder->cancelForReason(kReason, kSync));
  EXPECT_TRUE(service.abandoned().empty());
  EXPECT_EQ(service.placeholder("com.b")->cancellation, (FakeCancellation{kReason, kSync}));
}

TEST_F(FakeInstallCoordinationTest, UninstallCompletesOnEitherThread) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.registry.add(FakeApp::installed("com.b"));
  std::thread::id thread;
  const auto note = [&](const std::optional<Error>& error) {
    EXPECT_EQ(error, std::nullopt);
    thread = std::this_thread::get_id();
  };
  service.uninstallApp("com.a", platform::UserConfirmation::skip, note);
  service.waitUntilIdle();
  EXPECT_NE(thread, std::this_thread::get_id());
  service.completeUninstalls(CallbackOn::callingThread);
  service.uninstallApp("com.b", platform::UserConfirmation::ask, note);
  EXPECT_EQ(thread, std::this_thread::get_id());
  EXPECT_TRUE(platform.registry.identifiers().empty());
  EXPECT_EQ(platform.journal.lines({"installCoordination."}),
            (std::vector<std::string>{"installCoordination.uninstallApp com.a",
                                      "installCoordination.uninstallApp com.b ask"}));
}

// Misuse.

TEST(FakeInstallCoordinationMisuse, ChangingAnotherClientsCoordinator) {
  FakePlatform platform;
  platform.coordination.add(FakeCoordinator::of("com.a").madeBy(ClientIdentity::CXClientBazaarly));
  const auto coordinator = platform.coordination.coordinatorForApp(
      CoordinatorKind::initiating, "com.a", ClientIdentity::CXClientSync, IfMissing::findNothing, nullptr, nullptr);
  EXPECT_NONFATAL_FAILURE(coordinator->setInstallOptions({}).ignore(),
                          "setInstallOptions on <initiating coordinator com.a> of client 1 by client 3");
  EXPECT_TRUE(coordinator->cancelForReason(kReason, ClientIdentity::CXClientSync));
}

TEST(FakeInstallCoordinationMisuse, DestroyingTheServiceWithHeldObjects) {
  auto platform = std::make_unique<FakePlatform>();
  auto promise =
      platform->coordination.makePromisedTransferToPath("com.a", ClientIdentity::CXClientSync, std::nullopt, 0);
  EXPECT_NONFATAL_FAILURE(platform.reset(), "an object of it is held");
  promise.reset();
}

TEST(FakeInstallCoordinationMisuse, DestroyingTheServiceWithAnOpenConnection) {
  CallJournal journal;
  FakeFileSystem files(journal);
  FakeUninstalledAppsList uninstalled(journal);
  FakeAppRegistry registry(journal, files, uninstalled);
  auto service = std::make_unique<FakeInstallCoordination>(journal, files, registry);
  platform::InstallObserverDelegate delegate;
  auto connection = service->initWithMachServiceName("name", {ClientIdentity::CXClientSync}, delegate);
  EXPECT_NONFATAL_FAILURE(service.reset(), "while a connection is open");
  connection.reset();
}

TEST(FakeInstallCoordinationMisuse, TriggeringAnEventWithoutCoordinator) {
  FakePlatform platform;
  EXPECT_NONFATAL_FAILURE(platform.coordination.prioritize("com.a"), "no coordinator of com.a");
}

}  // namespace appsync::test
