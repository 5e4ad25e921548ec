// Getting a restored app ready with the install-coordination service.
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/restore/RestoreFixture.h"

namespace appsync::test {
namespace {

using platform::CoordinatorKind;
using platform::TransactionPhase;
using platform::TransactionStep;
using platform::TSInstallType;
using Steps = std::vector<StepEntry>;

class CoordinatedRestore : public CoordinatedRestoreFixture {
 protected:
  [[nodiscard]] FakeCoordinator coordinator() const { return platform.coordination.coordinator("com.a").value(); }

  static FakePromise promiseNamed(const char* name) {
    FakePromise promise;
    promise.kind = FakePromiseKind::outOfBand;
    promise.name = name;
    promise.isComplete = true;
    return promise;
  }
  static FakePlaceholder ownPlaceholder() {
    FakePlaceholder placeholder;
    placeholder.identifier = "com.a";
    return placeholder;
  }
};

/// From the folder to the finished placeholder.
LogLines placeholderLines(int installType) {
  const std::string folder(kAppFolder);
  const std::string icon(kAppIcon);
  const std::string type = std::to_string(installType);
  return {called("fileSystem.temporaryDirectory"),
          called("fileSystem.createDirectory " + folder),
          logged("Created app directory for 'com.a' at " + folder + " with err=(null)"),
          called("fileSystem.createFile " + icon),
          called("fileSystem.attributesOfItem " + icon),
          logged("icon data for 'com.a' was writen to " + icon + " with status:1 fileSize:9"),
          called("transactionLog.logStep 4 com.a y Create placeholder"),
          called("installCoordination.initAppPlaceholder com.a " + type + " An App"),
          called("transactionLog.logStep 4 com.a y Finished creating placeholder"),
          logged("Created placeholder <placeholder com.a> for 'com.a' of type " + type),
          called("installCoordination.makePromisedTransferToPath com.a-Icon 9 " + icon),
          called("promise.setPercentComplete com.a-Icon 1"),
          called("promise.setComplete com.a-Icon"),
          called("placeholder.setIconPromise com.a com.a-Icon"),
          logged("Added icon promise to placeholder for 'com.a'"),
          called("placeholder.setPlaceholderAttributes com.a"),
          logged("set <PlaceholderAttributes version 2.0> placeholder attributes for com.a"),
          called("placeholder.setMetadata com.a"),
          logged("set store metadata on placeholder for com.a"),
          called("placeholder.setSinfData com.a"),
          logged("set SINF data on placeholder for com.a"),
          called("placeholder.setConfigurationComplete com.a"),
          logged("set placeholder configuration complete for com.a")};
}

LogLines userDataLines() {
  return {called("coordinator.hasUserDataPromise com.a"),
          called("installCoordination.makePromisedOutOfBandTransfer com.a-UserData 0"),
          called("promise.setPercentComplete com.a-UserData 1"),
          called("promise.setComplete com.a-UserData"),
          called("coordinator.setUserDataPromise com.a com.a-UserData"),
          logged("Added out of band user data promise for for com.a")};
}

LogLines handOverLines() {
  return {called("coordinator.setPlaceholderPromise com.a"),
          logged("DataMigrator will wait for CN to install placeholder for com.a, _restoringPlaceholderCount 1"),
          logged("added placeholder promise for com.a")};
}

LogLines joined(std::initializer_list<LogLines> parts) {
  LogLines all;
  for (const LogLines& part : parts)
    all.insert(all.end(), part.begin(), part.end());
  return all;
}

TEST_F(CoordinatedRestore, EveryStepOfAnAppThatWasNotDemotedIsTakenInOrder) {
  EXPECT_TRUE(prepare());
  EXPECT_TRUE(
      sameLines(joined({{logged("processing app restore for non demoted bundle 'com.a' with install coordination"),
                         called("transactionLog.logStep 2 com.a y Restore app"),
                         called("installCoordination.coordinatorForApp restoring com.a create"),
                         called("coordinator.appAssetPromiseResponsibleClient com.a"),
                         called("coordinator.creatorIdentifier com.a"), called("coordinator.setObserver com.a")},
                        userDataLines(),
                        {called("coordinator.hasPlaceholderPromise com.a")},
                        placeholderLines(2),
                        handOverLines(),
                        {called("coordinator.setAppAssetPromiseResponsibleClient com.a 1"),
                         logged("set CXClientBazaarly to satisfy app asset promise for com.a"),
                         logged("processing app restore for com.a finished with status 1 error (null)"),
                         called("transactionLog.logStep 2 com.a y Restore app")}}),
                platform.log.lines()));
}

TEST_F(CoordinatedRestore, EveryStepOfADemotedAppIsTakenInOrder) {
  EXPECT_TRUE(prepare(DemotionStatus::automaticallyDemoted));
  EXPECT_TRUE(
      sameLines(joined({{logged("processing app restore for demoted bundle 'com.a' with install coordination"),
                         called("transactionLog.logStep 2 com.a y Restore demoted app"),
                         called("installCoordination.coordinatorForApp restoringDemoted com.a create"),
                         called("coordinator.creatorIdentifier com.a"), called("coordinator.setObserver com.a")},
                        userDataLines(),
                        {called("coordinator.hasPlaceholderPromise com.a")},
                        placeholderLines(7),
                        handOverLines(),
                        {logged("processing app restore for demoted app com.a finished with status 1 error (null)"),
                         called("transactionLog.logStep 2 com.a y Restore demoted app")}}),
                platform.log.lines()));
}

TEST_F(CoordinatedRestore, TheStepsStandInTheTransactionLog) {
  EXPECT_TRUE(prepare());
  const auto entry = [](TransactionStep step, TransactionPhase phase, const char* text) {
    return StepEntry{step, phase, Success::yes, "com.a", text};
  };
  EXPECT_EQ(platform.transactions.steps(),
            (Steps{entry(TransactionStep::restoreApp, TransactionPhase::begin, "Restore app"),
                   entry(TransactionStep::createPlaceholder, TransactionPhase::begin, "Create placeholder"),
                   entry(TransactionStep::createPlaceholder, TransactionPhase::end, "Finished creating placeholder"),
                   entry(TransactionStep::restoreApp, TransactionPhase::end, "Restore app")}));
}

TEST_F(CoordinatedRestore, ACoordinatorIsLeftForWhichTheStoreBringsThePackage) {
  EXPECT_TRUE(prepare());
  const FakeCoordinator ready = coordinator();
  EXPECT_EQ(ready.kind, CoordinatorKind::restoring);
  EXPECT_EQ(ready.creator, kSync);
  EXPECT_EQ(ready.responsibleClient, kStore);
  EXPECT_FALSE(ready.appAsset);
  ASSERT_TRUE(ready.userData && ready.placeholder && ready.placeholder->icon);
  EXPECT_TRUE(ready.userData->isComplete);
  EXPECT_TRUE(ready.placeholder->isConfigured);
  EXPECT_EQ(ready.placeholder->bundleName, "An App");
  EXPECT_EQ(ready.placeholder->installType, TSInstallType::Restore);
  EXPECT_EQ(ready.placeholder->metadata->value().dictionary(), storeMetadata());
  EXPECT_EQ(textOf(*ready.placeholder->sinfData), "a licence");
  EXPECT_EQ(ready.placeholder->icon->diskSpaceNeeded, 9U);
  EXPECT_EQ(platform.files.text(kAppIcon), "a picture");
  EXPECT_EQ(platform.files.owners(kAppFolder), (platform::OwnerAttributes{"mobile", "mobile"}));
  EXPECT_EQ(platform.files.owners(kAppIcon), (platform::OwnerAttributes{"mobile", "mobile"}));
}

TEST_F(CoordinatedRestore, TheInstallTypeTellsHowAnAppWasDemoted) {
  AppsClient& client = makeTracedClient();
  EXPECT_TRUE(prepare(client, DemotionStatus::intentionallyDemoted));
  EXPECT_EQ(coordinator().placeholder->installType, TSInstallType::IntentionalDowngrade);
  EXPECT_EQ(static_cast<int>(coordinator().placeholder->installType), 8);
  platform.coordination.complete("com.a");
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(prepare(client, DemotionStatus::automaticallyDemoted));
  EXPECT_EQ(coordinator().placeholder->installType, TSInstallType::Downgrade);
  EXPECT_EQ(coordinator().kind, CoordinatorKind::restoringDemoted);
  EXPECT_EQ(coordinator().responsibleClient, std::nullopt);
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
}

TEST_F(CoordinatedRestore, AnAppWithoutAnIconIsRestoredAllTheSame) {
  AppsClient& client = makeTracedClient();
  for (const std::optional<ByteView>& none : {std::optional<ByteView>(), std::optional<ByteView>(ByteView())}) {
    icon = none;
    EXPECT_TRUE(prepare(client));
    EXPECT_FALSE(coordinator().placeholder->icon);
    EXPECT_EQ(coordinator().responsibleClient, kStore);
    platform.coordination.complete("com.a");
    platform.coordination.waitUntilIdle();
  }
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
}

TEST_F(CoordinatedRestore, AnAppThatIsTheStoresAlreadyIsLeftToIt) {
  platform.coordination.add(FakeCoordinator::of("com.a", CoordinatorKind::restoring).withResponsibleClient(kStore));
  EXPECT_TRUE(prepare());
  EXPECT_TRUE(sameLines({logged("processing app restore for non demoted bundle 'com.a' with install coordination"),
                         called("transactionLog.logStep 2 com.a y Restore app"),
                         called("installCoordination.coordinatorForApp restoring com.a create"),
                         called("coordinator.appAssetPromiseResponsibleClient com.a"),
                         logged("App asset DRI for com.a is set to 1 - nothing more for zeph to do"),
                         called("transactionLog.logStep 2 com.a y Restore app")},
                        platform.log.lines()));
  EXPECT_EQ(platform.transactions.steps().back(),
            (StepEntry{TransactionStep::restoreApp, TransactionPhase::end, Success::yes, "com.a", "Restore app"}));
  EXPECT_TRUE(coordinator().observer.expired());
}

TEST_F(CoordinatedRestore, TheStoresOwnCoordinatorIsLeftToIt) {
  platform.coordination.add(FakeCoordinator::of("com.a", CoordinatorKind::restoring).madeBy(kStore));
  EXPECT_TRUE(prepare());
  EXPECT_TRUE(said("App asset DRI for com.a is set to 1 - nothing more for zeph to do"));
}

TEST_F(CoordinatedRestore, AnotherClientsCoordinatorIsNeitherDrivenNorCancelled) {
  const std::string foreign = description(Error{"ZTError", 29, "client 17 created the coordinator", nullptr});
  for (const DemotionStatus status : {DemotionStatus::notDemoted, DemotionStatus::intentionallyDemoted}) {
    const bool isDemoted = status != DemotionStatus::notDemoted;
    const auto kind = isDemoted ? CoordinatorKind::restoringDemoted : CoordinatorKind::restoring;
    const std::string app = isDemoted ? "demoted app com.a" : "com.a";
    platform.coordination.add(FakeCoordinator::of("com.a", kind).madeBy(platform::ClientIdentity{17}));
    EXPECT_FALSE(prepare(status));
    EXPECT_TRUE(complained("Error " + foreign + " creating restore coordinator for com.a"));
    EXPECT_TRUE(said("processing app restore for " + app + " finished with status 0 error " + foreign));
    EXPECT_EQ(platform.journal.count("coordinator.cancelForReason"), 0U);
    EXPECT_EQ(platform.journal.count("coordinator.set"), 0U);
  }
  EXPECT_EQ(platform.coordination.coordinators().size(), 2U);
}

TEST_F(CoordinatedRestore, WhatAnInterruptedRunLeftIsKeptAndCompleted) {
  platform.coordination.add(FakeCoordinator::of("com.a", CoordinatorKind::restoring)
                                .withUserData(promiseNamed("com.a-UserData"))
                                .withPlaceholder(ownPlaceholder()));
  EXPECT_TRUE(prepare());
  EXPECT_TRUE(sameLines(
      {logged("processing app restore for non demoted bundle 'com.a' with install coordination"),
       called("transactionLog.logStep 2 com.a y Restore app"),
       called("installCoordination.coordinatorForApp restoring com.a create"),
       called("coordinator.appAssetPromiseResponsibleClient com.a"), called("coordinator.creatorIdentifier com.a"),
       called("coordinator.setObserver com.a"), called("coordinator.hasUserDataPromise com.a"),
       logged("Coordinator for com.a has a valid user data promise"), called("coordinator.hasPlaceholderPromise com.a"),
       logged("Coordinator for com.a has a valid placeholder promise"),
       called("coordinator.setAppAssetPromiseResponsibleClient com.a 1"),
       logged("set CXClientBazaarly to satisfy app asset promise for com.a"),
       logged("processing app restore for com.a finished with status 1 error (null)"),
       called("transactionLog.logStep 2 com.a y Restore app")},
      platform.log.lines()));
}

TEST_F(CoordinatedRestore, OnlyThePromiseThatIsMissingIsAdded) {
  platform.coordination.add(
      FakeCoordinator::of("com.a", CoordinatorKind::restoringDemoted).withUserData(promiseNamed("com.a-UserData")));
  EXPECT_TRUE(prepare(DemotionStatus::automaticallyDemoted));
  EXPECT_TRUE(said("Coordinator for com.a has a valid user data promise"));
  EXPECT_TRUE(said("added placeholder promise for com.a"));
  EXPECT_EQ(platform.journal.count("coordinator.setUserDataPromise"), 0U);
  platform.coordination.didInstallPlaceholder("com.a");
  platform.coordination.waitUntilIdle();
}

TEST_F(CoordinatedRestore, WithoutAUserDataPromiseItGoesOn) {
  platform.coordination.failures.failNext("installCoordination.makePromisedOutOfBandTransfer", "com.a-UserData", error);
  EXPECT_TRUE(prepare());
  EXPECT_FALSE(coordinator().userData);
  EXPECT_TRUE(coordinator().placeholder);
}

TEST_F(CoordinatedRestore, MetadataThatDoesNotParseMakesNoCoordinatorAndWithdrawsTheApp) {
  metadata.resize(0);
  AppsClient& client = makeTracedClient();
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.a");
  platform.log.clear();
  EXPECT_FALSE(prepare(client));
  const std::string failure = description(plist::read(ByteView()).error());
  EXPECT_TRUE(sameLines(
      {logged("processing app restore for non demoted bundle 'com.a' with install coordination"),
       called("transactionLog.logStep 2 com.a y Restore app"),
       loggedError("failed to parse harvo metadata for 'com.a'. err=" + failure),
       logged("processing app restore for com.a finished with status 0 error " + failure),
       called("transactionLog.logStep 2 com.a n Restore app"),
       logged("DataMigrator cancelled coordinator for restoring app bundle com.a _restoringPlaceholderCount 0")},
      platform.log.lines()));
  EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
}

TEST_F(CoordinatedRestore, MetadataThatIsNoDictionaryMakesNoCoordinatorAndChangesNoCount) {
  metadata = xmlForm(plist::Array{"title"});
  EXPECT_FALSE(prepare(DemotionStatus::intentionallyDemoted));
  EXPECT_TRUE(
      complained("failed to parse harvo metadata for 'com.a'. err=PropertyList 2 \"The root is not a dictionary\""));
  EXPECT_TRUE(platform.coordination.coordinators().empty());
  for (const std::string& message : platform.log.messages())
    EXPECT_EQ(message.find("DataMigrator"), std::string::npos) << message;
}

TEST_F(CoordinatedRestore, TheCoordinatorReportsToTheClient) {
  EXPECT_TRUE(prepare());
  platform.coordination.didInstallPlaceholder("com.a");
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(said("CN finished installing placeholder for com.a, _restoringPlaceholderCount 0"));
}

/// The service may show it, and report that on its own thread, before the call that hands it over has returned. The
/// queue on which reports are taken up is held meanwhile: another turn on it, here on the same thread, is refused.
TEST_F(CoordinatedRestore, APlaceholderIsAwaitedBeforeTheServiceCanReportIt) {
  AppsClient& client = makeClient();
  bool reportHadToWait = false;
  platform.journal.setHook([&](std::string_view operation, std::string_view) -> std::optional<Error> {
    if (operation != "coordinator.setPlaceholderPromise") return std::nullopt;
    try {
      client.cnDidInstallPlaceHolderForAppBundle("com.a");
    } catch (const std::logic_error&) {
      reportHadToWait = true;
    }
    return std::nullopt;
  });
  EXPECT_TRUE(prepare(client));
  EXPECT_TRUE(reportHadToWait);
}

TEST_F(CoordinatedRestore, ACoordinatorDoesNotKeepTheClientAlive) {
  EXPECT_TRUE(prepare());
  platform.coordination.didInstallPlaceholder("com.a");
  platform.coordination.waitUntilIdle();
  const std::weak_ptr<AppsClient> gone = takeClient();
  EXPECT_TRUE(gone.expired());
}

}  // namespace
}  // namespace appsync::test
