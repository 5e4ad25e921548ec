// The factory of coordinators, placeholders and promises.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::CoordinatorKind;
using platform::TransactionPhase;
using platform::TransactionStep;
using platform::TSInstallType;
using Steps = std::vector<StepEntry>;

Steps coordinatorSteps(Success success) {
  return {
      {TransactionStep::createCoordinator, TransactionPhase::begin, Success::yes, "com.a", "Create coordinator"},
      {TransactionStep::createCoordinator, TransactionPhase::end, success, "com.a", "Finished creating coordinator"}};
}

Steps placeholderSteps(Success success) {
  return {
      {TransactionStep::createPlaceholder, TransactionPhase::begin, Success::yes, "com.a", "Create placeholder"},
      {TransactionStep::createPlaceholder, TransactionPhase::end, success, "com.a", "Finished creating placeholder"}};
}

class CoordinatorLookup : public CoordinationFixture {
 protected:
  auto find(bool existingApp, bool createIfNotExisting, ErrorSlot slot = nullptr) {
    return client()._initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier("com.a", existingApp,
                                                                                  createIfNotExisting, slot);
  }

  AppsClient& client() {
    if (!made_) made_ = &makeTracedClient();
    return *made_;
  }

 private:
  AppsClient* made_ = nullptr;
};

class Promises : public CoordinatorLookup {
 protected:
  std::shared_ptr<platform::InstallCoordinator> coordinator() {
    auto found = find(false, true);
    platform.log.clear();
    platform.journal.clear();
    return found;
  }

  std::shared_ptr<platform::Placeholder> placeholder() {
    auto made = client()._placeHolderForBundleIdentifier("com.a", "An App", TSInstallType::Sync);
    platform.log.clear();
    return made;
  }
};

struct Choice {
  bool existingApp;
  bool createIfNotExisting;
  const char* call;
  const char* kind;
};

TEST_F(CoordinatorLookup, TheKindFollowsFromTheAppAndTheFlagIsPassedOn) {
  for (const Choice& choice : {Choice{false, true, "initiating com.a create", "initiating"},
                               Choice{true, true, "updating com.a create", "updating"},
                               Choice{false, false, "initiating com.a find", "initiating"},
                               Choice{true, false, "updating com.a find", "updating"}}) {
    platform.log.clear();
    EXPECT_NE(find(choice.existingApp, choice.createIfNotExisting), nullptr) << choice.call;
    const std::string flags = "(createIfNotExisting:" + std::to_string(choice.createIfNotExisting) +
                              ", existingApp:" + std::to_string(choice.existingApp) + ")";
    EXPECT_TRUE(sameLines({called("transactionLog.logStep 3 com.a y Create coordinator"),
                           called("installCoordination.coordinatorForApp " + std::string(choice.call)),
                           called("coordinator.creatorIdentifier com.a"),
                           logged("Created " + std::string(choice.kind) + " coordinator <" + choice.kind +
                                  " coordinator com.a> " + flags + " for com.a with error (null)"),
                           called("transactionLog.logStep 3 com.a y Finished creating coordinator")},
                          platform.log.lines()));
  }
}

TEST_F(CoordinatorLookup, ALookUpAloneMakesNothingAndSaysNothing) {
  std::optional<Error> slot = error;
  EXPECT_EQ(find(false, false, &slot), nullptr);
  EXPECT_EQ(slot, std::nullopt);
  EXPECT_TRUE(platform.coordination.coordinators().empty());
  EXPECT_TRUE(sameLines({called("transactionLog.logStep 3 com.a y Create coordinator"),
                         called("installCoordination.coordinatorForApp initiating com.a find"),
                         called("transactionLog.logStep 3 com.a n Finished creating coordinator")},
                        platform.log.lines()));
}

TEST_F(CoordinatorLookup, BothEntriesOfTheStepAreWrittenByPartyOneAlsoForAFailure) {
  platform.coordination.failures.failNext("installCoordination.coordinatorForApp", "com.a", error);
  EXPECT_EQ(find(true, true), nullptr);
  EXPECT_EQ(platform.transactions.steps(), coordinatorSteps(Success::no));
  EXPECT_EQ(static_cast<int>(platform.transactions.steps()[0].party), 1);
}

TEST_F(CoordinatorLookup, TheServicesErrorIsPassedOn) {
  platform.coordination.failures.failNext("installCoordination.coordinatorForApp", "com.a", error);
  std::optional<Error> slot;
  EXPECT_EQ(find(false, true, &slot), nullptr);
  EXPECT_EQ(slot, error);
}

TEST_F(CoordinatorLookup, ACoordinatorOfAnotherClientIsNoneAndTheRefusalNamesItsCreator) {
  platform.coordination.add(FakeCoordinator::of("com.a").madeBy(kStore));
  std::optional<Error> slot = error;
  EXPECT_EQ(find(false, true, &slot), nullptr);
  EXPECT_EQ(slot, std::nullopt);
  EXPECT_TRUE(
      said("CN returned initiating coordinator <initiating coordinator com.a> (createIfNotExisting:1, existingApp:0, "
           "creatorIdentifier=1) for com.a with error (null) - Will not perform install/update for this bundle"));
  EXPECT_EQ(platform.transactions.steps(), coordinatorSteps(Success::no));
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
}

TEST_F(CoordinatorLookup, AsksForForeignCreatorOnce) {
  platform.coordination.add(FakeCoordinator::of("com.a").madeBy(kStore));
  EXPECT_EQ(find(false, true), nullptr);
  EXPECT_EQ(platform.journal.count("coordinator.creatorIdentifier"), 1U);
}

TEST_F(CoordinatorLookup, AnUnknownClientsCoordinatorIsRefusedByItsNumber) {
  platform.coordination.add(FakeCoordinator::of("com.a", CoordinatorKind::updating).madeBy(clientOf(17)));
  EXPECT_EQ(find(true, false), nullptr);
  EXPECT_TRUE(
      said("CN returned updating coordinator <updating coordinator com.a> (createIfNotExisting:0, existingApp:1, "
           "creatorIdentifier=17) for com.a with error (null) - Will not perform install/update for this bundle"));
}

TEST_F(CoordinatorLookup, AForeignCoordinatorOfTheOtherKindIsNotMet) {
  platform.coordination.add(FakeCoordinator::of("com.a", CoordinatorKind::updating).madeBy(kStore));
  EXPECT_NE(find(false, true), nullptr);
}

TEST_F(Promises, APlaceholderCarriesNameTypeAndClient) {
  const auto made = client()._placeHolderForBundleIdentifier("com.a", "An App", TSInstallType::Downgrade);
  ASSERT_NE(made, nullptr);
  EXPECT_EQ(made->bundleName(), "An App");
  EXPECT_EQ(made->bundleID(), "com.a");
  EXPECT_EQ(made->installType(), TSInstallType::Downgrade);
  EXPECT_EQ(made->client(), kSync);
  EXPECT_TRUE(sameLines({called("transactionLog.logStep 4 com.a y Create placeholder"),
                         called("installCoordination.initAppPlaceholder com.a 7 An App"),
                         called("transactionLog.logStep 4 com.a y Finished creating placeholder"),
                         logged("Created placeholder <placeholder com.a> for 'com.a' of type 7")},
                        platform.log.lines()));
  EXPECT_EQ(platform.transactions.steps(), placeholderSteps(Success::yes));
}

TEST_F(Promises, APlaceholderThatCannotBeMadeIsAFailedStep) {
  platform.coordination.failures.failNext("installCoordination.initAppPlaceholder", "com.a", error);
  EXPECT_EQ(client()._placeHolderForBundleIdentifier("com.a", "An App", TSInstallType::Sync), nullptr);
  EXPECT_EQ(platform.transactions.steps(), placeholderSteps(Success::no));
  EXPECT_TRUE(said("Created placeholder (null) for 'com.a' of type 4"));
}

TEST_F(Promises, WithoutACoordinatorThereIsNoAppAssetPromiseAndNoWord) {
  EXPECT_EQ(client()._createAppAssetPromiseForBundleIdentifier("com.a", "/a.zip", nullptr), nullptr);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(Promises, AnAppAssetPromiseHasThePackagesPath) {
  const auto promise = client()._createAppAssetPromiseForBundleIdentifier("com.a", "/a.zip", coordinator());
  ASSERT_NE(promise, nullptr);
  const auto made = platform.coordination.promise("com.a-Asset");
  EXPECT_EQ(made->transferPath, platform::FileLocation::file("/a.zip"));
  EXPECT_EQ(made->client, kSync);
  EXPECT_EQ(made->diskSpaceNeeded, 0U);
  EXPECT_FALSE(made->isComplete);
  EXPECT_TRUE(made->isAttached);
  EXPECT_TRUE(sameLines({called("installCoordination.makePromisedTransferToPath com.a-Asset 0 /a.zip"),
                         called("coordinator.setAppAssetPromise com.a com.a-Asset"),
                         logged("Added app asset promise to coordinator for 'com.a'")},
                        platform.log.lines()));
}

TEST_F(Promises, AnAppAssetPromiseWithoutAPathIsMadeAndAttachedAllTheSame) {
  EXPECT_NE(client()._createAppAssetPromiseForBundleIdentifier("com.a", std::nullopt, coordinator()), nullptr);
  EXPECT_EQ(platform.coordination.promise("com.a-Asset")->transferPath, std::nullopt);
  EXPECT_EQ(platform.coordination.coordinator("com.a")->appAsset->name, "com.a-Asset");
}

TEST_F(Promises, AnAppAssetPromiseThatCannotBeMadeIsLogged) {
  platform.coordination.failures.failNext("installCoordination.makePromisedTransferToPath", "com.a-Asset", error);
  EXPECT_EQ(client()._createAppAssetPromiseForBundleIdentifier("com.a", std::nullopt, coordinator()), nullptr);
  EXPECT_TRUE(complained("Error creating asset promise for 'com.a'"));
  EXPECT_EQ(platform.journal.count("coordinator.setAppAssetPromise"), 0U);
}

TEST_F(Promises, AnAppAssetPromiseThatCannotBeAttachedIsCancelledWithCodeThirty) {
  const auto attachedTo = coordinator();
  platform.coordination.failures.failNext("coordinator.setAppAssetPromise", "com.a", error);
  EXPECT_EQ(client()._createAppAssetPromiseForBundleIdentifier("com.a", "/a.zip", attachedTo), nullptr);
  EXPECT_TRUE(sameLines(
      {called("installCoordination.makePromisedTransferToPath com.a-Asset 0 /a.zip"),
       called("coordinator.setAppAssetPromise com.a com.a-Asset"),
       loggedError("Error " + description(error) + " adding app asset promise at /a.zip to 'com.a'"),
       loggedError("Cancelling asset promise for 'com.a'"), called("promise.cancelForReason com.a-Asset ZTError 30 3")},
      platform.log.lines()));
  EXPECT_TRUE(platform.coordination.abandoned().empty());
}

TEST_F(Promises, AnAppAssetPromiseWithoutAPathThatCannotBeAttachedSaysSo) {
  const auto attachedTo = coordinator();
  platform.coordination.failures.failNext("coordinator.setAppAssetPromise", "com.a", error);
  EXPECT_EQ(client()._createAppAssetPromiseForBundleIdentifier("com.a", std::nullopt, attachedTo), nullptr);
  EXPECT_TRUE(complained("Error " + description(error) + " adding app asset promise at (null) to 'com.a'"));
}

TEST_F(Promises, WithoutAPlaceholderThereIsNoIconPromise) {
  EXPECT_EQ(client()._createIconPromiseForBundleIdentifier("com.a", "/Icon.png", 9, nullptr, true), nullptr);
  EXPECT_TRUE(sameLines({loggedError("Placeholder to add icon promise is nil for 'com.a'")}, platform.log.lines()));
}

TEST_F(Promises, AnIconPromiseIsFulfilledBeforeItIsAttached) {
  const auto owner = placeholder();
  EXPECT_NE(client()._createIconPromiseForBundleIdentifier("com.a", "/Icon.png", 9, owner, true), nullptr);
  EXPECT_TRUE(sameLines(
      {called("installCoordination.makePromisedTransferToPath com.a-Icon 9 /Icon.png"),
       called("promise.setPercentComplete com.a-Icon 1"), called("promise.setComplete com.a-Icon"),
       called("placeholder.setIconPromise com.a com.a-Icon"), logged("Added icon promise to placeholder for 'com.a'")},
      platform.log.lines()));
  EXPECT_EQ(platform.coordination.promise("com.a-Icon")->client, kSync);
  EXPECT_TRUE(owner->cancelForReason(error, kSync));
}

TEST_F(Promises, AnIconPromiseThatCannotBeMadeIsSilentlyNone) {
  const auto owner = placeholder();
  platform.coordination.failures.failNext("installCoordination.makePromisedTransferToPath", "com.a-Icon", error);
  EXPECT_EQ(client()._createIconPromiseForBundleIdentifier("com.a", "/Icon.png", 9, owner, true), nullptr);
  EXPECT_TRUE(sameLines({called("installCoordination.makePromisedTransferToPath com.a-Icon 9 /Icon.png")},
                        platform.log.lines()));
}

TEST_F(Promises, AnIconPromiseThatCannotBeAttachedIsCancelledWithACodeForInstallsAndOneForRestores) {
  for (const bool forAppInstall : {true, false}) {
    const auto owner = placeholder();
    platform.coordination.failures.failNext("placeholder.setIconPromise", "com.a", error);
    EXPECT_EQ(client()._createIconPromiseForBundleIdentifier("com.a", "/Icon.png", 9, owner, forAppInstall), nullptr);
    EXPECT_TRUE(complained("Error " + description(error) + " adding icon promise to placeholder for 'com.a'"));
    const auto promise = platform.coordination.promise("com.a-Icon");
    ASSERT_TRUE(promise->cancellation);
    EXPECT_EQ(promise->cancellation, (FakeCancellation{{"ZTError", forAppInstall ? 30 : 29, {}, nullptr}, kSync}));
  }
}

TEST_F(Promises, TheUserDataPromiseIsFulfilledAndNobodys) {
  const auto promise = client()._userDataPromiseForBundleIdentifier("com.a");
  ASSERT_NE(promise, nullptr);
  EXPECT_TRUE(
      sameLines({called("installCoordination.makePromisedOutOfBandTransfer com.a-UserData 0"),
                 called("promise.setPercentComplete com.a-UserData 1"), called("promise.setComplete com.a-UserData")},
                platform.log.lines()));
  const auto made = platform.coordination.promise("com.a-UserData");
  EXPECT_EQ(made->client, kSync);
  EXPECT_FALSE(made->isAttached);
}

TEST_F(Promises, AUserDataPromiseThatCannotBeMadeIsNone) {
  platform.coordination.failures.failNext("installCoordination.makePromisedOutOfBandTransfer", "com.a-UserData", error);
  EXPECT_EQ(client()._userDataPromiseForBundleIdentifier("com.a"), nullptr);
  EXPECT_EQ(platform.journal.count("promise."), 0U);
}

}  // namespace
}  // namespace appsync::test
