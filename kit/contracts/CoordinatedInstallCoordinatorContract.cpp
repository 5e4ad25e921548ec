// CoordinatedInstallContract: look-ups and set operations of coordinators.
#include "kit/contracts/InstallCoordinationContract.h"

namespace appsync::test {

using platform::IfMissing;

TEST_P(CoordinatedInstallContract, CoordinationIsEnabled) {
  EXPECT_TRUE(service().coordinationIsEnabled());
}

// Look-ups.

TEST_P(CoordinatedInstallContract, FindingNoCoordinatorSetsNoError) {
  for (const Kind kind : {Kind::any, Kind::initiating, Kind::updating, Kind::restoring, Kind::restoringDemoted})
    EXPECT_EQ(find("com.a", kind), nullptr);
}

TEST_P(CoordinatedInstallContract, CreatesAMissingCoordinatorForTheClient) {
  for (const Kind kind : {Kind::initiating, Kind::updating, Kind::restoring, Kind::restoringDemoted}) {
    bool created = false;
    std::optional<Error> error;
    const Coordinator made = service().coordinatorForApp(kind, "com.a", kStore, IfMissing::create, &created, &error);
    ASSERT_NE(made, nullptr);
    EXPECT_TRUE(created);
    EXPECT_EQ(error, std::nullopt);
    EXPECT_EQ(made->kind(), kind);
    EXPECT_EQ(made->bundleID(), "com.a");
    EXPECT_EQ(made->creatorIdentifier(), kStore);
    EXPECT_FALSE(made->description().empty());
  }
}

TEST_P(CoordinatedInstallContract, NewCoordinatorHasNoOptionsOrPromises) {
  const Coordinator made = coordinator("com.a");
  EXPECT_FALSE(made->hasInstallOptions());
  EXPECT_FALSE(made->hasInitialODRAssetPromises());
  EXPECT_FALSE(made->hasAppAssetPromise());
  EXPECT_EQ(made->appAssetPromise(), nullptr);
  EXPECT_FALSE(made->hasUserDataPromise());
  EXPECT_FALSE(made->hasPlaceholderPromise());
  EXPECT_EQ(made->coordinatorError(), std::nullopt);
}

TEST_P(CoordinatedInstallContract, SecondLookUpFindsTheSameCoordinator) {
  const Coordinator first = coordinator("com.a");
  bool created = true;
  const Coordinator second =
      service().coordinatorForApp(Kind::initiating, "com.a", kSync, IfMissing::create, &created, nullptr);
  ASSERT_NE(second, nullptr);
  EXPECT_FALSE(created);
  EXPECT_TRUE(first->setInstallOptions(options()));
  EXPECT_TRUE(second->hasInstallOptions());
  EXPECT_FALSE(second->setInstallOptions(options()));
}

TEST_P(CoordinatedInstallContract, FindsAnotherClientsCoordinatorUnchanged) {
  const Coordinator foreign = coordinator("com.a", Kind::initiating, kStore);
  bool created = true;
  const Coordinator found =
      service().coordinatorForApp(Kind::initiating, "com.a", kSync, IfMissing::create, &created, nullptr);
  ASSERT_NE(found, nullptr);
  EXPECT_FALSE(created);
  EXPECT_EQ(found->creatorIdentifier(), kStore);
}

TEST_P(CoordinatedInstallContract, AcceptsOtherClientNumbers) {
  const Coordinator made = coordinator("com.a", Kind::initiating, Client{77});
  EXPECT_EQ(made->creatorIdentifier(), Client{77});
  EXPECT_EQ(find("com.a")->creatorIdentifier(), Client{77});
}

TEST_P(CoordinatedInstallContract, AppCanHaveOneCoordinatorOfEachKind) {
  const Coordinator initiating = coordinator("com.a", Kind::initiating);
  const Coordinator restoring = coordinator("com.a", Kind::restoring);
  EXPECT_TRUE(initiating->setInstallOptions(options()));
  EXPECT_FALSE(restoring->hasInstallOptions());
  EXPECT_EQ(find("com.a", Kind::updating), nullptr);
}

TEST_P(CoordinatedInstallContract, CoordinatorsOfDifferentAppsAreIndependent) {
  const Coordinator first = coordinator("com.a");
  const Coordinator second = coordinator("com.b");
  EXPECT_TRUE(first->setInstallOptions(options()));
  EXPECT_FALSE(second->hasInstallOptions());
  EXPECT_TRUE(cancel(*first));
  EXPECT_NE(find("com.b"), nullptr);
}

TEST_P(CoordinatedInstallContract, AnyKindFindsButNeverCreates) {
  bool created = true;
  std::optional<Error> error;
  EXPECT_EQ(service().coordinatorForApp(Kind::any, "com.a", kSync, IfMissing::create, &created, &error), nullptr);
  EXPECT_EQ(error, std::nullopt);
  const Coordinator made = coordinator("com.a", Kind::updating);
  const Coordinator found = find("com.a", Kind::any);
  ASSERT_NE(found, nullptr);
  EXPECT_EQ(found->kind(), Kind::updating);
}

TEST_P(CoordinatedInstallContract, AnyKindPrefersTheClientsOwnThenTheOldest) {
  const Coordinator oldest = coordinator("com.a", Kind::restoring, kStore);
  const Coordinator younger = coordinator("com.a", Kind::initiating, Client{9});
  EXPECT_EQ(find("com.a")->kind(), Kind::restoring);
  const Coordinator own = coordinator("com.a", Kind::updating);
  const Coordinator youngest = coordinator("com.a", Kind::restoringDemoted);
  EXPECT_EQ(find("com.a")->kind(), Kind::updating);
  EXPECT_TRUE(cancel(*own));
  EXPECT_EQ(find("com.a")->kind(), Kind::restoringDemoted);
  EXPECT_TRUE(cancel(*youngest));
  EXPECT_EQ(find("com.a")->kind(), Kind::restoring);
}

TEST_P(CoordinatedInstallContract, CoordinatorOutlivesItsHandles) {
  Coordinator made = coordinator("com.a");
  EXPECT_TRUE(made->setInstallOptions(options()));
  EXPECT_TRUE(made->setAppAssetPromise(makeAsset()));
  made.reset();
  const Coordinator found = find("com.a", Kind::initiating);
  ASSERT_NE(found, nullptr);
  EXPECT_TRUE(found->hasInstallOptions());
  EXPECT_TRUE(found->hasAppAssetPromise());
}

TEST_P(CoordinatedInstallContract, EndedCoordinatorCanBeReplaced) {
  const Coordinator ended = coordinator("com.a");
  EXPECT_TRUE(ended->setInstallOptions(options()));
  EXPECT_TRUE(cancel(*ended));
  bool created = false;
  const Coordinator made =
      service().coordinatorForApp(Kind::initiating, "com.a", kSync, IfMissing::create, &created, nullptr);
  ASSERT_NE(made, nullptr);
  EXPECT_TRUE(created);
  EXPECT_FALSE(made->hasInstallOptions());
  EXPECT_EQ(made->coordinatorError(), std::nullopt);
  EXPECT_EQ(ended->coordinatorError(), reason());
}

// Set operations.

TEST_P(CoordinatedInstallContract, EachValueCanBeSetOnce) {
  const Coordinator made = coordinator("com.a");
  EXPECT_TRUE(made->setInstallOptions(options()));
  EXPECT_FALSE(made->setInstallOptions(options()));
  EXPECT_TRUE(made->setInitialODRAssetPromises({makeUserData("first")}));
  EXPECT_FALSE(made->setInitialODRAssetPromises({}));
  EXPECT_TRUE(made->setAppAssetPromise(makeAsset("asset")));
  EXPECT_FALSE(made->setAppAssetPromise(makeAsset("other asset")));
  EXPECT_TRUE(made->setUserDataPromise(makeUserData("data")));
  EXPECT_FALSE(made->setUserDataPromise(makeUserData("other data")));
  EXPECT_TRUE(made->setPlaceholderPromise(makePlaceholder("com.a")));
  EXPECT_FALSE(made->setPlaceholderPromise(makePlaceholder("com.a")));
  EXPECT_TRUE(made->hasInstallOptions() && made->hasInitialODRAssetPromises() && made->hasAppAssetPromise() &&
              made->hasUserDataPromise() && made->hasPlaceholderPromise());
  ASSERT_NE(made->appAssetPromise(), nullptr);
  EXPECT_EQ(made->appAssetPromise()->name(), "asset");
}

TEST_P(CoordinatedInstallContract, AcceptsAnEmptyListOfOnDemandResources) {
  const Coordinator made = coordinator("com.a");
  EXPECT_TRUE(made->setInitialODRAssetPromises({}));
  EXPECT_TRUE(made->hasInitialODRAssetPromises());
}

TEST_P(CoordinatedInstallContract, CreatorIsResponsibleUnlessAnotherClientIsSet) {
  const Coordinator own = coordinator("com.a", Kind::restoring);
  const Coordinator foreign = coordinator("com.b", Kind::restoring, kStore);
  std::optional<Error> error;
  EXPECT_EQ(own->appAssetPromiseResponsibleClient(&error), kSync);
  EXPECT_EQ(foreign->appAssetPromiseResponsibleClient(nullptr), kStore);
  EXPECT_TRUE(own->setAppAssetPromiseResponsibleClient(kStore));
  EXPECT_EQ(own->appAssetPromiseResponsibleClient(&error), kStore);
  EXPECT_EQ(error, std::nullopt);
  EXPECT_FALSE(own->setAppAssetPromiseResponsibleClient(kSync));
  EXPECT_EQ(own->appAssetPromiseResponsibleClient(&error), kStore);
}

TEST_P(CoordinatedInstallContract, RefusalsHaveTheServicesErrorDomain) {
  const Coordinator made = coordinator("com.a");
  EXPECT_TRUE(made->setInstallOptions(options()));
  const Status refused = made->setInstallOptions(options());
  ASSERT_FALSE(refused);
  EXPECT_EQ(refused.error().domain, platform::kInstallCoordinationErrorDomain);
  EXPECT_NE(refused.error().code, 1);
}

TEST_P(CoordinatedInstallContract, EndedCoordinatorCannotBeChanged) {
  const Coordinator ended = coordinator("com.a");
  EXPECT_TRUE(cancel(*ended));
  const Asset asset = makeAsset();
  EXPECT_FALSE(ended->setInstallOptions(options()));
  EXPECT_FALSE(ended->setInitialODRAssetPromises({}));
  EXPECT_FALSE(ended->setAppAssetPromise(asset));
  EXPECT_FALSE(ended->setAppAssetPromiseResponsibleClient(kStore));
  EXPECT_FALSE(ended->setUserDataPromise(makeUserData()));
  EXPECT_FALSE(ended->setPlaceholderPromise(makePlaceholder("com.a")));
  EXPECT_FALSE(cancel(*ended));
  EXPECT_TRUE(coordinator("com.a")->setAppAssetPromise(asset))
      << "a refused promise must stay with the caller and be usable";
}

// User-presentable errors.

TEST_P(CoordinatedInstallContract, UserPresentableErrorKeepsUnderlyingError) {
  const Error shown = service().createUserPresentableError(1, {}, reason());
  EXPECT_EQ(shown.domain, platform::kInstallCoordinationErrorDomain);
  EXPECT_EQ(shown.code, 1);
  ASSERT_NE(shown.underlying, nullptr);
  EXPECT_EQ(*shown.underlying, reason());
}

}  // namespace appsync::test
