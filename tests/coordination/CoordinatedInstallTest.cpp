// Making everything ready for a package that the host is about to send.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::CoordinatorKind;
using platform::StoreMetadata;
using platform::TransactionPhase;
using platform::TransactionStep;
using platform::TSInstallType;
using Steps = std::vector<StepEntry>;

class CoordinatedInstall : public CoordinationFixture {
 protected:
  bool prepare(bool existingApp = false) {
    return makeTracedClient().prepareAppForInstallUsingCoordination(asset, existingApp);
  }

  [[nodiscard]] FakeCoordinator coordinator() const { return platform.coordination.coordinator("com.a").value(); }

  /// The lines about the app's folder, icon and placeholder that a preparation writes.
  [[nodiscard]] std::string processing(const std::string& title) const {
    return "processing app install for bundle 'com.a', title " + title + " assetplist " +
           description(plist::Value(info)) + ", version 3.1 with install coordination";
  }
};

TEST_F(CoordinatedInstall, EveryStepIsTakenInOrder) {
  EXPECT_TRUE(prepare());
  const std::string folder(kPlaceholderFolder);
  const std::string icon(kPlaceholderIcon);
  EXPECT_TRUE(sameLines(
      {called("fileSystem.readFile " + std::string(kStagedInfo)),
       called("fileSystem.readFile " + std::string(kStagedStore)),
       loggedIn(14, processing("An App")),
       called("transactionLog.logStep 1 com.a y Install App"),
       called("transactionLog.logStep 3 com.a y Create coordinator"),
       called("installCoordination.coordinatorForApp initiating com.a create"),
       called("coordinator.creatorIdentifier com.a"),
       logged("Created initiating coordinator <initiating coordinator com.a> (createIfNotExisting:1, existingApp:0) "
              "for com.a with error (null)"),
       called("transactionLog.logStep 3 com.a y Finished creating coordinator"),
       called("coordinator.setObserver com.a"),
       called("coordinator.hasInstallOptions com.a"),
       called("coordinator.setInstallOptions com.a"),
       logged("set install options on coordinator for com.a"),
       called("coordinator.hasInitialODRAssetPromises com.a"),
       called("coordinator.setInitialODRAssetPromises com.a 0"),
       logged("set ODR asset promise to install coordinator for com.a"),
       called("coordinator.hasAppAssetPromise com.a"),
       called("installCoordination.makePromisedTransferToPath com.a-Asset 0"),
       called("coordinator.setAppAssetPromise com.a com.a-Asset"),
       logged("Added app asset promise to coordinator for 'com.a'"),
       called("coordinator.hasPlaceholderPromise com.a"),
       called("fileSystem.temporaryDirectory"),
       called("fileSystem.createDirectory " + folder),
       logged("Created app directory for 'com.a' at " + folder + " with err=(null)"),
       called("transactionLog.logStep 5 com.a y Copying icon"),
       called("fileSystem.copyItem " + std::string(kStagedIcon) + " " + icon),
       called("fileSystem.attributesOfItem " + icon),
       logged("icon for com.a at " + icon + " has a size of 9"),
       logged("Copied icon from " + std::string(kStagedIcon) + " to " + icon +
              " with error (null) for 'com.a', sizeOnDisk:9"),
       called("transactionLog.logStep 5 com.a y Copying icon"),
       called("transactionLog.logStep 4 com.a y Create placeholder"),
       called("installCoordination.initAppPlaceholder com.a 4 An App"),
       called("transactionLog.logStep 4 com.a y Finished creating placeholder"),
       logged("Created placeholder <placeholder com.a> for 'com.a' of type 4"),
       called("installCoordination.makePromisedTransferToPath com.a-Icon 9 " + icon),
       called("promise.setPercentComplete com.a-Icon 1"),
       called("promise.setComplete com.a-Icon"),
       called("placeholder.setIconPromise com.a com.a-Icon"),
       logged("Added icon promise to placeholder for 'com.a'"),
       called("placeholder.setPlaceholderAttributes com.a"),
       logged("set <PlaceholderAttributes version 3.1, launch prohibited> attributes on placeholder for com.a"),
       called("placeholder.setMetadata com.a"),
       logged("set store metadata on placeholder for com.a"),
       called("placeholder.setConfigurationComplete com.a"),
       logged("set placeholder configuration as complete for com.a"),
       called("coordinator.setPlaceholderPromise com.a"),
       logged("added placeholder promise to coordinator for com.a"),
       logged("processing app install for bundle com.a finished with status 1 error (null)"),
       called("transactionLog.logStep 1 com.a y Install app")},
      platform.log.lines()));
}

TEST_F(CoordinatedInstall, TheStepsOfANewAppStandInTheTransactionLog) {
  EXPECT_TRUE(prepare());
  const auto entry = [](TransactionStep step, TransactionPhase phase, const char* text) {
    return StepEntry{step, phase, Success::yes, "com.a", text};
  };
  EXPECT_EQ(platform.transactions.steps(),
            (Steps{entry(TransactionStep::installApp, TransactionPhase::begin, "Install App"),
                   entry(TransactionStep::createCoordinator, TransactionPhase::begin, "Create coordinator"),
                   entry(TransactionStep::createCoordinator, TransactionPhase::end, "Finished creating coordinator"),
                   entry(TransactionStep::copyIcon, TransactionPhase::begin, "Copying icon"),
                   entry(TransactionStep::copyIcon, TransactionPhase::end, "Copying icon"),
                   entry(TransactionStep::createPlaceholder, TransactionPhase::begin, "Create placeholder"),
                   entry(TransactionStep::createPlaceholder, TransactionPhase::end, "Finished creating placeholder"),
                   entry(TransactionStep::installApp, TransactionPhase::end, "Install app")}));
}

TEST_F(CoordinatedInstall, ACoordinatorIsLeftThatLacksNothingButThePackage) {
  EXPECT_TRUE(prepare());
  const FakeCoordinator ready = coordinator();
  EXPECT_EQ(ready.kind, CoordinatorKind::initiating);
  EXPECT_EQ(ready.creator, kSync);
  ASSERT_TRUE(ready.options && ready.options->storeMetadata());
  EXPECT_EQ(ready.options->storeMetadata()->dictionary(), store);
  EXPECT_EQ(ready.options->installType(), TSInstallType::Sync);
  EXPECT_EQ(ready.options->installTargetType(), 1U);
  ASSERT_TRUE(ready.initialODRAssets);
  EXPECT_TRUE(ready.initialODRAssets->empty());
  EXPECT_EQ(ready.appAsset->transferPath, std::nullopt);
  EXPECT_FALSE(ready.appAsset->isComplete);
  ASSERT_TRUE(ready.placeholder);
  EXPECT_TRUE(ready.placeholder->isConfigured);
  EXPECT_EQ(ready.placeholder->bundleName, "An App");
  EXPECT_EQ(ready.placeholder->attributes->infoDictionary(), info);
  EXPECT_TRUE(ready.placeholder->attributes->launchProhibited());
  EXPECT_EQ(ready.placeholder->attributes->bundleVersion(), "3.1");
  EXPECT_EQ(ready.placeholder->metadata->value().dictionary(), store);
  EXPECT_EQ(ready.placeholder->icon->diskSpaceNeeded, 9U);
  EXPECT_EQ(platform.files.text(kPlaceholderIcon), "a picture");
  EXPECT_EQ(platform.files.owners(kPlaceholderFolder), (platform::OwnerAttributes{"mobile", "mobile"}));
}

TEST_F(CoordinatedInstall, AnUpdateAsksForTheOtherKindAndSaysSo) {
  EXPECT_TRUE(prepare(true));
  EXPECT_EQ(coordinator().kind, CoordinatorKind::updating);
  EXPECT_EQ(platform.transactions.steps().front().description, "Update app");
  EXPECT_EQ(platform.transactions.steps().back().description, "Install app");
}

TEST_F(CoordinatedInstall, TheCoordinatorReportsToTheClient) {
  EXPECT_TRUE(prepare());
  platform.coordination.prioritize("com.a");
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(said("Prioritize com.a"));
}

TEST_F(CoordinatedInstall, ACoordinatorDoesNotKeepTheClientAlive) {
  EXPECT_TRUE(prepare());
  const std::weak_ptr<AppsClient> gone = takeClient();
  EXPECT_TRUE(gone.expired());
  EXPECT_TRUE(coordinator().observer.expired());
}

TEST_F(CoordinatedInstall, AnAppWithAnEmptyNameButAnIdentifierIsPrepared) {
  platform::ZTAsset unnamed("com.a", "Application", "");
  EXPECT_TRUE(makeClient().prepareAppForInstallUsingCoordination(unnamed, false));
  EXPECT_EQ(platform.coordination.placeholder("com.a")->bundleName, "");
}

TEST_F(CoordinatedInstall, AnAppWithoutANameGoesByItsIdentifier) {
  platform::ZTAsset unnamed("com.a", "Application", std::nullopt);
  EXPECT_TRUE(makeClient().prepareAppForInstallUsingCoordination(unnamed, false));
  EXPECT_EQ(platform.coordination.placeholder("com.a")->bundleName, "com.a");
  EXPECT_TRUE(platform.log.contains(
      loggedIn(14,
               "processing app install for bundle 'com.a', title (null) assetplist (null), version (null) with install "
               "coordination")));
}

TEST_F(CoordinatedInstall, AnAppWithNeitherNameNorIdentifierFailsWithoutACoordinator) {
  for (const std::optional<std::string>& name : {std::optional<std::string>(""), std::optional<std::string>()}) {
    const platform::ZTAsset nobody("", "Application", name);
    AppsClient& client = makeTracedClient();
    EXPECT_FALSE(client.prepareAppForInstallUsingCoordination(nobody, false));
    EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
    EXPECT_TRUE(said("processing app install for bundle  finished with status 0 error (null)"));
    EXPECT_EQ(platform.transactions.steps().back().success, Success::no);
  }
}

TEST_F(CoordinatedInstall, AnAppWithANameAloneIsTried) {
  const platform::ZTAsset nameOnly("", "Application", "An App");
  makeClient().prepareAppForInstallUsingCoordination(nameOnly, false);
  EXPECT_EQ(platform.journal.count("installCoordination.coordinatorForApp"), 1U);
}

TEST_F(CoordinatedInstall, AnotherClientsCoordinatorIsNeitherDrivenNorCancelled) {
  platform.coordination.add(FakeCoordinator::of("com.a").madeBy(kStore));
  EXPECT_FALSE(prepare());
  EXPECT_EQ(platform.journal.lines({"coordinator."}), std::vector<std::string>{"coordinator.creatorIdentifier com.a"});
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
  EXPECT_TRUE(said("processing app install for bundle com.a finished with status 0 error (null)"));
}

TEST_F(CoordinatedInstall, ASecondPreparationFindsEverythingAndMakesNothing) {
  EXPECT_TRUE(prepare());
  platform.log.clear();
  platform.journal.clear();
  EXPECT_TRUE(prepare());
  EXPECT_EQ(platform.journal.lines({"coordinator.set", "installCoordination.make", "installCoordination.init",
                                    "placeholder.", "promise.", "fileSystem.c"}),
            std::vector<std::string>{"coordinator.setObserver com.a"});
  for (const char* has :
       {"install options", "an ODR app asset promise", "an app asset promise", "a placeholder promise"})
    EXPECT_TRUE(said("coordinator for com.a has " + std::string(has)));
  EXPECT_EQ(platform.coordination.promises().size(), 2U);
  EXPECT_EQ(platform.coordination.placeholders().size(), 1U);
}

TEST_F(CoordinatedInstall, OptionsThatAreThereLeaveThePlaceholderWithoutStoreMetadata) {
  platform.coordination.add(FakeCoordinator::of("com.a").withOptions({}));
  EXPECT_TRUE(prepare());
  EXPECT_TRUE(said("coordinator for com.a has install options"));
  ASSERT_TRUE(coordinator().placeholder->metadata);
  EXPECT_EQ(*coordinator().placeholder->metadata, std::nullopt);
  EXPECT_TRUE(platform.journal.contains("placeholder.setMetadata com.a none"));
}

TEST_F(CoordinatedInstall, AppsWithoutUsableDictionariesHaveNeitherInfoNorStoreMetadata) {
  platform.files.put(kStagedInfo, "\x01");
  platform.files.erase(kStagedStore);
  EXPECT_TRUE(prepare());
  EXPECT_EQ(coordinator().options->storeMetadata(), std::nullopt);
  EXPECT_TRUE(coordinator().placeholder->attributes->infoDictionary().empty());
  EXPECT_FALSE(coordinator().placeholder->attributes->launchProhibited());
}

TEST_F(CoordinatedInstall, TheDictionariesMayBeInAnyForm) {
  platform.files.put(kStagedInfo, binaryForm(plist::Value(info)));
  platform.files.put(kStagedStore, "{ itemId = 42; }");
  EXPECT_TRUE(prepare());
  EXPECT_EQ(coordinator().placeholder->attributes->infoDictionary(), info);
  EXPECT_EQ(coordinator().options->storeMetadata()->dictionary(), (plist::Dictionary{{"itemId", "42"}}));
}

TEST_F(CoordinatedInstall, LaunchProhibitedIsWhateverGivesABoolean) {
  const std::vector<std::pair<plist::Value, bool>> values{{"yes", true}, {0, false}, {plist::Array{}, false}};
  for (const auto& [value, prohibited] : values) {
    putPropertyList(platform.files, kStagedInfo, plist::Dictionary{{"TSApplicationLaunchProhibited", value}});
    EXPECT_TRUE(prepare());
    EXPECT_EQ(coordinator().placeholder->attributes->launchProhibited(), prohibited) << description(value);
    platform.coordination.cancelByUser("com.a");
    platform.coordination.waitUntilIdle();
  }
}

TEST_F(CoordinatedInstall, AVersionThatIsNoTextIsNone) {
  asset.setVariantOptions({{"Version", 3}});
  EXPECT_TRUE(prepare());
  EXPECT_EQ(coordinator().placeholder->attributes->bundleVersion(), std::nullopt);
}

TEST_F(CoordinatedInstall, TheServiceInstallsTheAppOnceItsPackageIsThere) {
  platform.coordination.installAutomatically();
  AppsClient& client = makeClient();
  EXPECT_TRUE(client.prepareAppForInstallUsingCoordination(asset, false));
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
  platform.files.put(kReceivedPackage, "package");
  asset.setPath(std::string(kReceivedPackage));
  client.transferCompleteForApp(asset, std::nullopt, false);
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
  EXPECT_TRUE(said("coordinatorDidCompleteSuccessfully for com.a with error (null)"));
}

}  // namespace
}  // namespace appsync::test
