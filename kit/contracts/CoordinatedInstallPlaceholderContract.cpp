// CoordinatedInstallContract: placeholders.
#include <atomic>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "kit/contracts/CoordinationListener.h"
#include "kit/contracts/InstallCoordinationContract.h"

namespace appsync::test {

using platform::PlaceholderAttributes;
using platform::PlaceholderLookup;
using platform::StoreMetadata;
using platform::TSInstallType;

TEST_P(CoordinatedInstallContract, PlaceholderReturnsItsInitialValues) {
  const AppPlaceholder placeholder = service().initAppPlaceholder("An App", "com.a", TSInstallType::Sync, kStore);
  ASSERT_NE(placeholder, nullptr);
  EXPECT_EQ(placeholder->bundleName(), "An App");
  EXPECT_EQ(placeholder->bundleID(), "com.a");
  EXPECT_EQ(placeholder->installType(), TSInstallType::Sync);
  EXPECT_EQ(placeholder->client(), kStore);
  EXPECT_FALSE(placeholder->description().empty());
}

TEST_P(CoordinatedInstallContract, PlaceholderNameCanBeEmpty) {
  const AppPlaceholder placeholder = service().initAppPlaceholder("", "com.a", TSInstallType::Sync, kSync);
  ASSERT_NE(placeholder, nullptr);
  EXPECT_EQ(placeholder->bundleName(), "");
  EXPECT_TRUE(placeholder->setConfigurationComplete());
  EXPECT_TRUE(coordinator("com.a")->setPlaceholderPromise(placeholder));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
}

TEST_P(CoordinatedInstallContract, ConfiguresAPlaceholder) {
  const AppPlaceholder placeholder = makePlaceholder("com.a");
  const Asset icon = service().makePromisedTransferToPath("com.a-Icon", kSync, subject().makeIcon(), 9);
  icon->setPercentComplete(1);
  icon->setComplete(true);
  PlaceholderAttributes attributes = PlaceholderAttributes::initWithInfoPlistDictionary({{"Key", "value"}});
  attributes.setLaunchProhibited(true);
  attributes.setBundleVersion("2.0");
  EXPECT_TRUE(placeholder->setIconPromise(icon));
  EXPECT_TRUE(placeholder->setPlaceholderAttributes(attributes));
  EXPECT_TRUE(placeholder->setMetadata(StoreMetadata::initWithDictionary({{"title", "An App"}})));
  EXPECT_TRUE(placeholder->setSinfData(bytesOf("licence")));
  EXPECT_TRUE(placeholder->setConfigurationComplete());
  EXPECT_TRUE(coordinator("com.a")->setPlaceholderPromise(placeholder));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
}

TEST_P(CoordinatedInstallContract, CompleteConfigurationCannotBeChanged) {
  const AppPlaceholder placeholder = makePlaceholder("com.a");
  EXPECT_TRUE(placeholder->setConfigurationComplete());
  const Asset icon = makeAsset("icon");
  EXPECT_FALSE(placeholder->setIconPromise(icon));
  EXPECT_FALSE(placeholder->setPlaceholderAttributes({}));
  EXPECT_FALSE(placeholder->setMetadata(std::nullopt));
  EXPECT_FALSE(placeholder->setSinfData(bytesOf("licence")));
  EXPECT_FALSE(placeholder->setConfigurationComplete());
  EXPECT_TRUE(coordinator("com.a")->setAppAssetPromise(icon))
      << "a refused promise must stay with the caller and be usable";
}

TEST_P(CoordinatedInstallContract, ConfiguredPlaceholderCanBeCancelled) {
  const AppPlaceholder placeholder = makeConfiguredPlaceholder("com.a");
  EXPECT_TRUE(placeholder->cancelForReason(reason(), kSync));
  EXPECT_FALSE(coordinator("com.a")->setPlaceholderPromise(placeholder));
}

TEST_P(CoordinatedInstallContract, CancelledPlaceholderCannotBeChanged) {
  const AppPlaceholder placeholder = makePlaceholder("com.a");
  EXPECT_TRUE(placeholder->cancelForReason(reason(), kSync));
  EXPECT_FALSE(placeholder->setIconPromise(makeAsset("icon")));
  EXPECT_FALSE(placeholder->setPlaceholderAttributes({}));
  EXPECT_FALSE(placeholder->setMetadata(std::nullopt));
  EXPECT_FALSE(placeholder->setSinfData(bytesOf("licence")));
  EXPECT_FALSE(placeholder->setConfigurationComplete());
  EXPECT_FALSE(placeholder->cancelForReason(reason(), kSync));
  const Coordinator made = coordinator("com.a");
  EXPECT_FALSE(made->setPlaceholderPromise(placeholder));
  EXPECT_FALSE(made->hasPlaceholderPromise());
}

TEST_P(CoordinatedInstallContract, CancellingAPlaceholderCancelsItsIconPromise) {
  const AppPlaceholder placeholder = makePlaceholder("com.a");
  const Asset icon = makeAsset("icon");
  EXPECT_TRUE(placeholder->setIconPromise(icon));
  EXPECT_TRUE(placeholder->cancelForReason(reason(), kSync));
  icon->setComplete(true);
  EXPECT_FALSE(icon->isComplete());
  EXPECT_FALSE(makePlaceholder("com.a")->setIconPromise(icon));
}

TEST_P(CoordinatedInstallContract, OnlyTheCoordinatorEndsItsPlaceholder) {
  const AppPlaceholder placeholder = makeConfiguredPlaceholder("com.a");
  EXPECT_TRUE(coordinator("com.a")->setPlaceholderPromise(placeholder));
  EXPECT_FALSE(placeholder->cancelForReason(reason(), kSync));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
}

TEST_P(CoordinatedInstallContract, PlaceholderFitsItsAppAndOneCoordinator) {
  const AppPlaceholder placeholder = makeConfiguredPlaceholder("com.a");
  EXPECT_FALSE(coordinator("com.b")->setPlaceholderPromise(placeholder));
  EXPECT_FALSE(coordinator("com.b")->hasPlaceholderPromise());
  EXPECT_FALSE(coordinator("com.b")->setPlaceholderPromise(nullptr));
  EXPECT_TRUE(coordinator("com.a")->setPlaceholderPromise(placeholder));
  EXPECT_FALSE(coordinator("com.a", Kind::restoring)->setPlaceholderPromise(placeholder));
}

TEST_P(CoordinatedInstallContract, RefusedPlaceholderStaysWithTheCaller) {
  EXPECT_TRUE(coordinator("com.a")->setPlaceholderPromise(makePlaceholder("com.a")));
  const AppPlaceholder placeholder = makeConfiguredPlaceholder("com.a");
  EXPECT_FALSE(coordinator("com.a")->setPlaceholderPromise(placeholder));
  EXPECT_TRUE(placeholder->cancelForReason(reason(), kSync));
}

// On the home screen.

TEST_P(CoordinatedInstallContract, DestroyedPlaceholderLeavesNothing) {
  AppPlaceholder placeholder = makeConfiguredPlaceholder("com.a");
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "absent");
  placeholder.reset();
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(CoordinatedInstallContract, ShowsAConfiguredPlaceholder) {
  const AppPlaceholder placeholder = makePlaceholder("com.a", TSInstallType::IntentionalDowngrade);
  EXPECT_TRUE(placeholder->setConfigurationComplete());
  EXPECT_TRUE(coordinator("com.a")->setPlaceholderPromise(placeholder));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
  const auto record = subject().registry().recordForIdentifier("com.a", PlaceholderLookup::on);
  ASSERT_NE(record, nullptr);
  EXPECT_EQ(record->installType(), TSInstallType::IntentionalDowngrade);
}

/// Clients hold a queue during the call, and process reports on that queue: a report within the call would deadlock.
TEST_P(CoordinatedInstallContract, ReportsNoPlaceholderOnCallingThread) {
  const auto caller = std::this_thread::get_id();
  std::atomic<int> reportsOnCaller = 0;
  const auto noteThread = [&](platform::InstallCoordinator&) {
    if (std::this_thread::get_id() == caller) ++reportsOnCaller;
  };
  CoordinationListener connected(noteThread);
  const auto connection = service().initWithMachServiceName("com.corvel.contract.observer", {kSync}, connected);
  const auto attached = std::make_shared<CoordinationListener>(noteThread);
  for (const Kind kind : {Kind::restoring, Kind::initiating}) {
    const std::string identifier = kind == Kind::restoring ? "com.a" : "com.b";
    const Coordinator made = coordinator(identifier, kind);
    made->setObserver(attached);
    EXPECT_TRUE(made->setPlaceholderPromise(makeConfiguredPlaceholder(identifier)));
  }
  const Coordinator later = coordinator("com.c");
  later->setObserver(attached);
  const AppPlaceholder unconfigured = makePlaceholder("com.c");
  EXPECT_TRUE(later->setPlaceholderPromise(unconfigured));
  EXPECT_TRUE(unconfigured->setConfigurationComplete());
  subject().waitUntilIdle();
  const std::vector<std::string> reports{"placeholder com.a", "placeholder com.b", "placeholder com.c"};
  EXPECT_EQ(connected.events(), reports);
  EXPECT_EQ(attached->events(), reports);
  EXPECT_EQ(reportsOnCaller, 0);
}

TEST_P(CoordinatedInstallContract, DoesNotShowAnUnconfiguredPlaceholder) {
  const AppPlaceholder placeholder = makePlaceholder("com.a");
  EXPECT_TRUE(coordinator("com.a")->setPlaceholderPromise(placeholder));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_TRUE(placeholder->setConfigurationComplete());
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "placeholder");
}

TEST_P(CoordinatedInstallContract, PlaceholderLeavesInstalledAppUsable) {
  install("com.a", "1.0");
  EXPECT_TRUE(coordinator("com.a", Kind::updating)->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "both");
  EXPECT_EQ(versionOf("com.a"), "1.0");
}

}  // namespace appsync::test
