// Making and ending the plug-in, and its fixed answers.
#include <atomic>
#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>
#include <set>
#include <stdexcept>
#include <stop_token>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/TextDiff.h"
#include "kit/fakes/Threads.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

using platform::RestrictionSetting;
using platform::RestrictionValue;
using platform::ZTAsset;

constexpr std::string_view kStartupComplete = "com.corvel.zeph.ZTStartupCompleteNotification";
constexpr std::string_view kObserverService = "com.corvel.zeph.xpc.cnappobserverdelegate";

class Lifecycle : public ClientFixture {
 protected:
  /// An asset whose package has been received.
  std::shared_ptr<ZTAsset> receivedAsset(const std::string& identifier) {
    auto asset = std::make_shared<ZTAsset>(identifier, "Application", std::nullopt);
    asset->setPath("/var/mobile/Media/PublicStaging/" + identifier);
    platform.files.put(*asset->path(), "package");
    return asset;
  }
};

}  // namespace

TEST_F(Lifecycle, ConstructionOutsideTheDaemonAsksEachServiceOnceInOrder) {
  const auto client = AppsClient::create(platform);
  EXPECT_TRUE(sameLines(
      {"backupManager.make", "registry.addObserver", "systemLog.createHandle com.corvel.appinstallation zeph.appsync",
       "transactionLog.initializeWithLog", "installCoordination.coordinationIsEnabled", "bundles.mainBundleIdentifier"},
      platform.journal.lines()));
}

TEST_F(Lifecycle, ConstructionInsideTheDaemonEndsWithTheStartupNotification) {
  platform.bundleFolders.setMainBundleIdentifier("com.corvel.zeph");
  const auto client = AppsClient::create(platform);
  EXPECT_TRUE(sameLines(
      {"backupManager.make", "registry.addObserver", "systemLog.createHandle com.corvel.appinstallation zeph.appsync",
       "transactionLog.initializeWithLog", "installCoordination.coordinationIsEnabled", "bundles.mainBundleIdentifier",
       "systemNotify.addObserver " + std::string(kStartupComplete)},
      platform.journal.lines()));
}

TEST_F(Lifecycle, OnlyTheDaemonsExactIdentifierCountsAsTheDaemon) {
  for (const char* identifier : {"com.corvel.zeph.helper", "com.corvel.Zeph", "", "com.corvel.zep"}) {
    platform.bundleFolders.setMainBundleIdentifier(identifier);
    const auto client = AppsClient::create(platform);
    EXPECT_EQ(platform.notify.observerCount(kStartupComplete), 0U) << identifier;
  }
}

TEST_F(Lifecycle, ConstructionAndDestructionSayNothing) {
  makeDaemonClient();
  takeClient().reset();
  EXPECT_TRUE(sameLines(LogLines{}, platform.log.lines()));
}

TEST_F(Lifecycle, TheTransactionLogAloneKeepsTheLogHandle) {
  makeClient();
  const auto handle = platform.transactions.log();
  ASSERT_NE(handle, nullptr);
  EXPECT_EQ(handle->subsystem, "com.corvel.appinstallation");
  EXPECT_EQ(handle->category, "zeph.appsync");
  EXPECT_EQ(handle.use_count(), 2) << "the transaction log's share and this test's";
}

TEST_F(Lifecycle, DestructionOutsideTheDaemonEndsTheObservationOfTheRegistryOnly) {
  makeClient();
  takeClient().reset();
  EXPECT_TRUE(sameLines({"registry.removeObserver"}, platform.journal.lines()));
  EXPECT_EQ(platform.registry.observerCount(), 0U);
  EXPECT_EQ(platform.backups.connections(), 0U);
}

TEST_F(Lifecycle, DestructionInsideTheDaemonEndsTheNotificationBeforeTheConnection) {
  makeDaemonClient();
  platform.notify.deliver(kStartupComplete);
  platform.journal.clear();
  takeClient().reset();
  EXPECT_TRUE(sameLines({"registry.removeObserver", "systemNotify.removeObserver " + std::string(kStartupComplete),
                         "installCoordination.close " + std::string(kObserverService)},
                        platform.journal.lines()));
}

TEST_F(Lifecycle, WhatTheDaemonRegisteredGoesWhateverTheMainBundleIsCalledByThen) {
  makeDaemonClient();
  platform.bundleFolders.setMainBundleIdentifier(std::nullopt);
  takeClient().reset();
  EXPECT_EQ(platform.notify.observerCount(kStartupComplete), 0U);
}

TEST_F(Lifecycle, DestructionWithOutstandingTransfersSaysHowMany) {
  AppsClient& client = makeClient();
  for (const char* identifier : {"com.a", "com.b", "com.a"})
    client.assetTransferUpdatedProgress(receivedAsset(identifier), 0.5);
  platform.log.clear();
  logCalls(platform);
  takeClient().reset();
  EXPECT_TRUE(sameLines(LogLines{loggedError("<AppsClient> getting dealloc'd with 2 outstanding DCX transfers!"),
                                 called("registry.removeObserver")},
                        platform.log.lines()));
}

TEST_F(Lifecycle, TheStartupNotificationOpensTheObserverConnection) {
  AppsClient& client = makeDaemonClient();
  EXPECT_TRUE(platform.coordination.connections().empty());
  platform.notify.deliver(kStartupComplete);
  const auto connections = platform.coordination.connections();
  ASSERT_EQ(connections.size(), 1U);
  EXPECT_EQ(connections[0].serviceName, kObserverService);
  EXPECT_EQ(connections[0].clients, std::set{platform::ClientIdentity::CXClientSync});
  EXPECT_EQ(connections[0].delegate, &client);
  EXPECT_TRUE(connections[0].isOpen);
}

TEST_F(Lifecycle, TheStartupNotificationIsHeardFromAnySender) {
  makeDaemonClient();
  const int sender = 0;
  platform.notify.deliver(kStartupComplete, &sender);
  EXPECT_EQ(platform.coordination.connections().size(), 1U);
}

TEST_F(Lifecycle, ASecondStartupNotificationOpensNoSecondConnection) {
  makeDaemonClient();
  platform.notify.deliver(kStartupComplete);
  platform.notify.deliver(kStartupComplete);
  EXPECT_EQ(platform.coordination.connections().size(), 1U);
}

TEST_F(Lifecycle, OutsideTheDaemonTheStartupNotificationOpensNothing) {
  makeClient();
  platform.notify.deliver(kStartupComplete);
  EXPECT_TRUE(platform.coordination.connections().empty());
}

TEST_F(Lifecycle, TheStartupCallbackWithoutAContextDoesNothing) {
  makeClient();
  _handleZEPHStartupCompletedNotification(nullptr, kStartupComplete, nullptr);
  EXPECT_TRUE(sameLines(std::vector<std::string>{}, platform.journal.lines()));
  EXPECT_TRUE(sameLines(LogLines{}, platform.log.lines()));
}

TEST_F(Lifecycle, TheStartupCallbackIgnoresNameAndObject) {
  AppsClient& client = makeDaemonClient();
  _handleZEPHStartupCompletedNotification(&client, "anything.else", &platform);
  EXPECT_EQ(platform.coordination.connections().size(), 1U);
}

TEST_F(Lifecycle, TheOneDataclassIsApplication) {
  EXPECT_EQ(makeClient().supportedDataclasses(), std::vector<std::string>{"Application"});
}

TEST_F(Lifecycle, TheAnchorIsConstantWhateverTheHostSent) {
  AppsClient& client = makeClient();
  EXPECT_EQ(client.currentSyncAnchor(), "NO_APP_SYNC_ANCHOR");
  EXPECT_TRUE(client.prepareForSyncWithHostAnchor("host-anchor-7", nullptr, nullptr));
  EXPECT_TRUE(client.reconcileSync({}, "host-anchor-8", nullptr, nullptr));
  EXPECT_EQ(client.currentSyncAnchor(), "NO_APP_SYNC_ANCHOR");
}

TEST_F(Lifecycle, PreparingASyncSucceedsWithoutCallsErrorsOrMessages) {
  AppsClient& client = makeClient();
  std::optional<Error> error;
  bool hasProgressed = false;
  const platform::ProgressCallback progress = [&](double) { hasProgressed = true; };
  EXPECT_TRUE(client.prepareForSyncWithHostAnchor("anchor", progress, &error));
  EXPECT_TRUE(client.prepareForSyncWithHostAnchor("", nullptr, nullptr));
  EXPECT_FALSE(error);
  EXPECT_FALSE(hasProgressed);
  EXPECT_TRUE(platform.journal.lines().empty());
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(Lifecycle, AnUnsetRestrictionAllows) {
  AppsClient& client = makeClient();
  EXPECT_TRUE(client._appInstallationAllowed());
  EXPECT_TRUE(client._appRemovalAllowed());
}

TEST_F(Lifecycle, ARestrictionThatSaysYesAllows) {
  AppsClient& client = makeClient();
  platform.restrictions.set(RestrictionSetting::appInstallationAllowed, RestrictionValue::yes);
  platform.restrictions.set(RestrictionSetting::appRemovalAllowed, RestrictionValue::yes);
  EXPECT_TRUE(client._appInstallationAllowed());
  EXPECT_TRUE(client._appRemovalAllowed());
}

TEST_F(Lifecycle, OnlyAnExplicitNoForbidsInstallation) {
  AppsClient& client = makeClient();
  platform.restrictions.set(RestrictionSetting::appInstallationAllowed, RestrictionValue::no);
  EXPECT_FALSE(client._appInstallationAllowed());
  EXPECT_TRUE(client._appRemovalAllowed());
}

TEST_F(Lifecycle, OnlyAnExplicitNoForbidsRemoval) {
  AppsClient& client = makeClient();
  platform.restrictions.set(RestrictionSetting::appRemovalAllowed, RestrictionValue::no);
  EXPECT_FALSE(client._appRemovalAllowed());
  EXPECT_TRUE(client._appInstallationAllowed());
}

TEST_F(Lifecycle, AnUnknownRestrictionAnswerAllows) {
  AppsClient& client = makeClient();
  platform.restrictions.set(RestrictionSetting::appRemovalAllowed, RestrictionValue{7});
  EXPECT_TRUE(client._appRemovalAllowed());
}

TEST_F(Lifecycle, EachRestrictionIsAskedForOnceUnderItsOwnName) {
  AppsClient& client = makeClient();
  static_cast<void>(client._appInstallationAllowed());
  static_cast<void>(client._appRemovalAllowed());
  EXPECT_TRUE(sameLines({"profileConnection.effectiveBoolValueForSetting appInstallationAllowed",
                         "profileConnection.effectiveBoolValueForSetting appRemovalAllowed"},
                        platform.journal.lines()));
}

TEST_F(Lifecycle, TheCountOfAttemptedInstallsIsReadOnceAndThenZero) {
  AppsClient& client = makeClient();
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 0);
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    client._performAssetInstall(receivedAsset(identifier));
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 3);
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 0);
}

TEST_F(Lifecycle, ConcurrentInstallsAreAllCounted) {
  AppsClient& client = makeClient();
  std::atomic<std::int32_t> counted = 0;
  runOnThreads(10, [&](std::size_t index) {
    for (int round = 0; round < 10; ++round) {
      client._performAssetInstall(receivedAsset("com.app" + std::to_string(index)));
      if (round % 3 == 0) counted += client._getAndResetNumAppInstallsAttempted();
    }
  });
  EXPECT_EQ(counted + client._getAndResetNumAppInstallsAttempted(), 100);
}

TEST_F(Lifecycle, TenInstallsRunAtOnceAndNoMore) {
  AppsClient& client = makeClient();
  platform.registry.installGate.close();
  for (int number = 0; number < 12; ++number)
    client._enqueueAssetInstall(receivedAsset("com.app" + std::to_string(number)));
  platform.registry.installGate.waitUntilStopped(10);
  EXPECT_EQ(platform.registry.installGate.stopped(), 10U);
  platform.registry.installGate.open();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(platform.registry.installs().size(), 12U);
  EXPECT_EQ(platform.registry.mostInstallsAtOnce(), 10U);
}

TEST_F(Lifecycle, WorkOnTheAccessQueueThatWouldWaitForItselfIsReportedUnderTheQueuesLabel) {
  AppsClient& client = makeClient();
  const auto asset = receivedAsset("com.a");
  std::string reported;
  platform.journal.setHook([&](std::string_view operation, std::string_view) -> std::optional<Error> {
    if (operation != "fileSystem.readFile" || !reported.empty()) return std::nullopt;
    try {
      client.assetInstallSucceeded(*asset);
    } catch (const std::logic_error& error) {
      reported = error.what();
    }
    return std::nullopt;
  });
  client.assetInstallSucceeded(*asset);  // Reads the todo list on the access queue.
  EXPECT_EQ(reported.substr(0, reported.find(':')), "com.corvel.qor.Zephtra.AppSync");
}

TEST_F(Lifecycle, TheLastOwnerMayBeOnAnyThread) {
  makeDaemonClient();
  platform.notify.deliver(kStartupComplete);
  std::jthread([client = takeClient()]() mutable { client.reset(); }).join();
  EXPECT_EQ(platform.registry.observerCount(), 0U);
  EXPECT_EQ(platform.notify.observerCount(kStartupComplete), 0U);
}

TEST_F(Lifecycle, AQueuedInstallMayBeTheLastOwner) {
  makeDaemonClient();
  platform.notify.deliver(kStartupComplete);
  platform.registry.installGate.close();
  {
    const auto client = takeClient();
    client->_enqueueAssetInstall(receivedAsset("com.a"));
    platform.registry.installGate.waitUntilStopped(1);
  }
  EXPECT_EQ(platform.registry.observerCount(), 1U) << "the install keeps the plug-in alive";
  platform.registry.installGate.open();
  platform.backups.waitUntilReleased();
  EXPECT_EQ(platform.registry.installs().size(), 1U);
  EXPECT_EQ(platform.registry.observerCount(), 0U);
}

TEST_F(Lifecycle, AScheduledRetryMayBeTheLastOwner) {
  makeClient();
  platform.screen.answerNext("com.a", {AssertionAnswer::denied()});
  {
    const auto client = takeClient();
    client->_performAssetInstall(receivedAsset("com.a"));
  }
  EXPECT_EQ(platform.registry.observerCount(), 1U) << "the retry keeps the plug-in alive";
  platform.time.advance(std::chrono::seconds(30));
  platform.backups.waitUntilReleased();
  EXPECT_EQ(platform.registry.installs().size(), 1U);
}

TEST_F(Lifecycle, DestructionMayMeetTheStartupNotification) {
  platform.bundleFolders.setMainBundleIdentifier("com.corvel.zeph");
  std::jthread posting([this](const std::stop_token& stop) {
    while (!stop.stop_requested())
      platform.notify.deliver(kStartupComplete);
  });
  for (int round = 0; round < 100; ++round)
    AppsClient::create(platform).reset();
  posting.request_stop();
  posting.join();
  EXPECT_EQ(platform.notify.observerCount(kStartupComplete), 0U);
  for (const auto& connection : platform.coordination.connections())
    EXPECT_FALSE(connection.isOpen);
}

TEST_F(Lifecycle, TwoObjectsDoNotDisturbEachOther) {
  const auto first = AppsClient::create(platform);
  auto second = AppsClient::create(platform);
  EXPECT_EQ(platform.registry.observerCount(), 2U);
  first->_performAssetInstall(receivedAsset("com.a"));
  EXPECT_EQ(second->_getAndResetNumAppInstallsAttempted(), 0);
  second.reset();
  EXPECT_EQ(platform.registry.observerCount(), 1U);
  EXPECT_EQ(first->_getAndResetNumAppInstallsAttempted(), 1);
}

}  // namespace appsync::test
