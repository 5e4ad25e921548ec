// What the install-coordination service and the registry report, in the words of the sync.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::TSInstallType;
using Operation = platform::ZTDeviceService::Operation;
using Strings = std::vector<std::string>;

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

class CoordinationCallbacks : public CoordinationFixture {
 protected:
  void SetUp() override {
    CoordinationFixture::SetUp();
    platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff");
    platform.files.put(kTodoListPath, binaryForm(plist::Array{entry("com.a", "DOWNLOADED")}));
    putPropertyList(platform.files, kRestoreStatePath, plist::Dictionary{{"com.a", plist::Dictionary{}}});
    platform.coordination.add(prepared());
  }

  /// Connected to the service, with an empty log.
  AppsClient& listen() {
    AppsClient& client = makeClient();
    client.setupInstallCoordinatorObserver();
    platform.log.clear();
    platform.journal.clear();
    return client;
  }

  /// What the client asked the device service for.
  [[nodiscard]] Strings asked() const { return platform.journal.lines({"deviceService."}); }
  [[nodiscard]] bool hasRestoreState() { return platform.files.has(kRestoreStatePath); }

  /// Told on this thread: when these return the callback has.
  void complete(std::optional<Error> failure = std::nullopt) {
    platform.coordination.complete("com.a", std::move(failure), CallbackOn::callingThread);
  }
  void prioritize() { platform.coordination.prioritize("com.a", CallbackOn::callingThread); }
  void cancelByUser(const std::string& identifier = "com.a") {
    platform.coordination.cancelByUser(identifier, CallbackOn::callingThread);
  }
};

TEST_F(CoordinationCallbacks, ABegunPromiseIsOnlyLogged) {
  listen().promiseDidBeginFulfillmentWithIdentifier(18446744073709551615U);
  EXPECT_TRUE(
      sameLines({logged("promiseDidBeginFulfillmentWithIdentifier 18446744073709551615")}, platform.log.lines()));
}

TEST_F(CoordinationCallbacks, AnInstalledPlaceholderIsCountedOff) {
  AppsClient& client = listen();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  platform.log.clear();
  platform.coordination.didInstallPlaceholder("com.a", std::nullopt, CallbackOn::callingThread);
  EXPECT_TRUE(sameLines({logged("coordinatorDidInstallPlaceholder for com.a with error (null)"),
                         logged("CN finished installing placeholder for com.a, _restoringPlaceholderCount 0")},
                        platform.log.lines()));
}

TEST_F(CoordinationCallbacks, APlaceholderWithAnErrorIsCountedOffAllTheSame) {
  AppsClient& client = listen();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  platform.log.clear();
  platform.coordination.didInstallPlaceholder("com.a", error, CallbackOn::callingThread);
  EXPECT_TRUE(sameLines({logged("coordinatorDidInstallPlaceholder for com.a with error " + description(error)),
                         logged("CN finished installing placeholder for com.a, _restoringPlaceholderCount 0")},
                        platform.log.lines()));
}

TEST_F(CoordinationCallbacks, ACompletionMarksTheAppInstalledAndCleansItsRestoreState) {
  listen();
  complete();
  EXPECT_TRUE(sameLines({logged("coordinatorDidCompleteSuccessfully for com.a with error (null)"),
                         logged("Changing com.a from DOWNLOADED to INSTALLED")},
                        platform.log.lines()));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "INSTALLED");
  EXPECT_FALSE(hasRestoreState());
}

TEST_F(CoordinationCallbacks, ACompletionWithAnErrorMarksItFailedAndCleansItsRestoreState) {
  listen();
  complete(error);
  EXPECT_TRUE(sameLines({logged("coordinatorDidCompleteSuccessfully for com.a with error " + description(error)),
                         logged("Changing com.a from DOWNLOADED to FAILED")},
                        platform.log.lines()));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "FAILED");
  EXPECT_FALSE(hasRestoreState());
}

TEST_F(CoordinationCallbacks, TheTodoListChangesBeforeTheRestoreState) {
  listen();
  complete();
  EXPECT_EQ(platform.journal.lines({"fileSystem.writeFileAtomically", "fileSystem.removeItem"}),
            (Strings{"fileSystem.writeFileAtomically " + std::string(kTodoListPath),
                     "fileSystem.removeItem " + std::string(kRestoreStatePath)}));
}

TEST_F(CoordinationCallbacks, TheAppIsNamedByAnAssetWithoutAPrettyName) {
  listen();
  prioritize();
  cancelByUser();
  const FakeSyncFramework::Download named{"com.a", "Application", std::nullopt};
  EXPECT_EQ(platform.framework.downloads(), (std::vector{named, named}));
}

TEST_F(CoordinationCallbacks, AnAppThatIsWantedFirstIsSentFirst) {
  listen();
  prioritize();
  EXPECT_EQ(asked(), (Strings{"deviceService.supports prioritizeAsset", "deviceService.prioritizeAsset com.a"}));
  EXPECT_TRUE(sameLines({logged("Prioritize com.a"), logged("Prioritize com.a finished with error (null)")},
                        platform.log.lines()));
}

TEST_F(CoordinationCallbacks, AFailureToSendItFirstIsOnlyLogged) {
  listen();
  platform.deviceService.failPrioritizing(error);
  prioritize();
  EXPECT_TRUE(said("Prioritize com.a finished with error " + description(error)));
}

TEST_F(CoordinationCallbacks, ADeviceServiceThatCannotPrioritizeIsNotAsked) {
  listen();
  platform.deviceService.stopSupporting(Operation::prioritizeAsset);
  prioritize();
  EXPECT_EQ(asked(), Strings{"deviceService.supports prioritizeAsset"});
  EXPECT_TRUE(sameLines({logged("Prioritize com.a"), loggedError("Cannot prioritize com.a as it's not supported")},
                        platform.log.lines()));
}

TEST_F(CoordinationCallbacks, TheAnswerToPrioritizingMayOutliveTheObject) {
  listen();
  platform.deviceService.holdCompletions();
  prioritize();
  const std::weak_ptr<AppsClient> gone = takeClient();
  EXPECT_TRUE(gone.expired());
  platform.deviceService.complete();
  EXPECT_TRUE(said("Prioritize com.a finished with error (null)"));
}

TEST_F(CoordinationCallbacks, ACancellationStopsTheTransfer) {
  listen();
  cancelByUser();
  EXPECT_EQ(asked(), (Strings{"deviceService.supports cancelAssetTransferForFailedAsset",
                              "deviceService.cancelAssetTransferForFailedAsset com.a"}));
  EXPECT_TRUE(sameLines({logged("Cancelling asset sync for com.a")}, platform.log.lines()));
}

TEST_F(CoordinationCallbacks, ASecondCancellationOfTheSameAppReachesNobody) {
  listen();
  cancelByUser();
  platform.coordination.add(prepared());
  platform.log.clear();
  platform.journal.clear();
  cancelByUser();
  EXPECT_TRUE(asked().empty());
  EXPECT_TRUE(sameLines({loggedError("Cannot cancel com.a as it's already cancelled 1 OR the call is not supported")},
                        platform.log.lines()));
}

TEST_F(CoordinationCallbacks, AfterTheTransfersHaveEndedACancellationCountsAnew) {
  AppsClient& client = listen();
  cancelByUser();
  client.assetTransferUpdatedProgress(std::make_shared<platform::ZTAsset>("com.b", "Application", "B"), 0.5);
  client.assetTransferEndedWithSuccess(false);
  platform.coordination.add(prepared());
  platform.journal.clear();
  cancelByUser();
  EXPECT_TRUE(platform.journal.contains("deviceService.cancelAssetTransferForFailedAsset com.a"));
}

TEST_F(CoordinationCallbacks, ADeviceServiceThatCannotCancelIsNotAsked) {
  listen();
  platform.deviceService.stopSupporting(Operation::cancelAssetTransferForFailedAsset);
  cancelByUser();
  EXPECT_EQ(asked(), Strings{"deviceService.supports cancelAssetTransferForFailedAsset"});
  EXPECT_TRUE(sameLines({loggedError("Cannot cancel com.a as it's already cancelled 0 OR the call is not supported")},
                        platform.log.lines()));
}

TEST_F(CoordinationCallbacks, WhoCancelsAndWhyDoesNotMatter) {
  listen();
  platform.coordination.cancel("com.a", {error, kStore}, CallbackOn::callingThread);
  EXPECT_TRUE(platform.journal.contains("deviceService.cancelAssetTransferForFailedAsset com.a"));
}

/// The device service may report a transfer's end before the call returns, and that takes the queue.
TEST_F(CoordinationCallbacks, TheDeviceServiceIsAskedOutsideTheQueue) {
  class Reporting final : public platform::ZTDeviceService {
   public:
    explicit Reporting(std::function<void(const std::shared_ptr<platform::ZTAsset>&)> report)
        : report_(std::move(report)) {}
    [[nodiscard]] bool supports(Operation) override { return true; }
    void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion) override { report_(asset); }
    void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) override { report_(asset); }

   private:
    std::function<void(const std::shared_ptr<platform::ZTAsset>&)> report_;
  };
  AppsClient* client = nullptr;
  Reporting service([&](const std::shared_ptr<platform::ZTAsset>& cancelled) {
    client->assetTransferSucceeded(cancelled, false, error);
  });
  platform.use(service);
  client = &listen();
  prioritize();
  cancelByUser();
  EXPECT_TRUE(said("transfer for asset com.a ended with success n error " + description(error) + " existingApp:0"));
}

TEST_F(CoordinationCallbacks, ReportsPlaceholderWithoutIdentifierAsIgnored) {
  listen();
  platform.coordination.add(FakeCoordinator::of("com.x").withoutIdentifier());
  platform.coordination.didInstallPlaceholder("com.x", std::nullopt, CallbackOn::callingThread);
  EXPECT_TRUE(sameLines({logged("coordinatorDidInstallPlaceholder for (null) with error (null)"),
                         loggedError("Ignoring notification from CN about installing placeholder for (null)")},
                        platform.log.lines()));
}

TEST_F(CoordinationCallbacks, ACoordinatorWithoutAnIdentifierIsIgnored) {
  listen();
  const auto nameless = [this] { platform.coordination.add(FakeCoordinator::of("com.x").withoutIdentifier()); };
  nameless();
  platform.coordination.prioritize("com.x", CallbackOn::callingThread);
  cancelByUser("com.x");
  EXPECT_TRUE(platform.log.lines().empty());
  nameless();
  platform.coordination.complete("com.x", std::nullopt, CallbackOn::callingThread);
  EXPECT_TRUE(
      sameLines({logged("coordinatorDidCompleteSuccessfully for (null) with error (null)")}, platform.log.lines()));
  EXPECT_TRUE(asked().empty());
  EXPECT_EQ(platform.journal.count("fileSystem."), 0U);
}

TEST_F(CoordinationCallbacks, WhatTheServiceReportsBesidesIsNotListenedTo) {
  listen();
  platform.coordination.pause("com.a", CallbackOn::callingThread);
  platform.coordination.resume("com.a", CallbackOn::callingThread);
  platform.coordination.beginRestoringUserData("com.a", CallbackOn::callingThread);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(CoordinationCallbacks, AnotherClientsCoordinatorsAreNotReported) {
  listen();
  platform.coordination.add(FakeCoordinator::of("com.b").madeBy(kStore));
  platform.coordination.prioritize("com.b", CallbackOn::callingThread);
  EXPECT_TRUE(platform.log.lines().empty());
}

/// Cancellations that the registry reports, on devices with and without coordination.
class CancelledInstalls : public ClientFixture {
 protected:
  void cancel(std::initializer_list<FakeApp> apps) {
    platform::AppRecords records;
    for (const FakeApp& app : apps) {
      platform.registry.add(app);
      records.push_back(std::make_shared<FakeAppRecord>(app));
    }
    AppsClient& client = makeClient();
    platform.log.clear();
    client.applicationInstallsDidCancel(records);
  }
};

TEST_F(CancelledInstalls, UnderCoordinationTheyAreNotHandled) {
  platform.coordination.enable();
  cancel({FakeApp::placeholder("com.a", TSInstallType::Restore)});
  EXPECT_TRUE(sameLines({logged("not handling applicationInstallsDidCancel because install coordination is enabled.")},
                        platform.log.lines()));
}

TEST_F(CancelledInstalls, ARestoreIsReportedAsAFailedTransfer) {
  cancel({FakeApp::placeholder("com.a", TSInstallType::Restore)});
  EXPECT_EQ(platform.log.lines().front(), logged("transfer for asset com.a ended with success n error " +
                                                 description(Error{"ZTError", 2, {}, nullptr}) + " existingApp:0"));
  EXPECT_FALSE(platform.registry.app("com.a"));
}

TEST_F(CancelledInstalls, InstallsOfOtherTypesAreNobodysBusiness) {
  cancel({FakeApp::placeholder("com.a", TSInstallType::StoreDownload), FakeApp::placeholder("com.b"),
          FakeApp::placeholder("com.c", TSInstallType::IntentionalDowngrade)});
  EXPECT_TRUE(platform.log.lines().empty());
  EXPECT_EQ(platform.registry.identifiers().size(), 3U);
}

TEST_F(CancelledInstalls, EachRestoreOfAReportIsTaken) {
  cancel({FakeApp::placeholder("com.a", TSInstallType::Restore), FakeApp::placeholder("com.b"),
          FakeApp::placeholder("com.c", TSInstallType::Restore)});
  EXPECT_EQ(platform.registry.identifiers(), Strings{"com.b"});
}

TEST_F(CancelledInstalls, TheRegistryReportsThemToTheObject) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore));
  makeClient();
  platform.registry.app("com.a")->progress->cancel();
  platform.registry.waitUntilReported();
  EXPECT_FALSE(platform.registry.app("com.a"));
}

}  // namespace
}  // namespace appsync::test
