// Reports of the services that meet operations of the daemon, and the object's end.
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/Threads.h"
#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using platform::IfMissing;
using platform::TSInstallType;

class CoordinationThreads : public CoordinationFixture {
 protected:
  void SetUp() override {
    CoordinationFixture::SetUp();
    platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff");
    platform.coordination.installAutomatically();
  }

  /// One sync of the app, whose transfer ends as told.
  void sync(AppsClient& client, bool arrives) {
    platform.files.put(kTodoListPath, binaryForm(plist::Array{installEntry("com.a")}));
    client.prepareForSyncWithHostAnchor("anchor", nullptr, nullptr);
    for (const auto& wanted : client.outstandingAssetTransfers()) {
      client.assetTransferUpdatedProgress(wanted, 0.5);
      platform.files.put(kReceivedPackage, "package");
      wanted->setIsDownload(true);
      wanted->setPath(std::string(kReceivedPackage));
      client.assetTransferSucceeded(wanted, arrives, arrives ? std::nullopt : std::optional(error));
    }
    client.assetTransferEndedWithSuccess(arrives);
  }

  /// The person who holds the device takes the app away, if it is on its way.
  void cancelAsUser(std::string_view identifier) {
    const auto coordinator = platform.coordination.coordinatorForApp(
        CoordinatorKind::any, identifier, ClientIdentity::CXClientUser, IfMissing::findNothing, nullptr, nullptr);
    if (coordinator) coordinator->cancelForReason(error, ClientIdentity::CXClientUser).ignore();
  }

  /// An app of the plug-in's own of which everything is reported that can be.
  void reportEverything(const std::string& identifier) {
    FakeInstallCoordination& service = platform.coordination;
    service.add(FakeCoordinator::of(identifier));
    service.didInstallPlaceholder(identifier);
    service.prioritize(identifier);
    service.cancelByUser(identifier);
    service.add(FakeCoordinator::of(identifier));
    service.complete(identifier);
  }

  static platform::AppRecords cancelledRestore() {
    return {std::make_shared<FakeAppRecord>(FakeApp::placeholder("com.r", TSInstallType::Restore))};
  }
};

TEST_F(CoordinationThreads, ReportsBeforeDuringAndAfterEveryOperationDisturbNone) {
  constexpr int kRounds = 20;
  AppsClient& client = makeDaemonClient();
  client.setupInstallCoordinatorObserver();
  runOnThreads(5, [&](std::size_t thread) {
    for (int round = 0; round < kRounds; ++round) {
      const std::string own = "com.thread" + std::to_string(thread) + "." + std::to_string(round);
      if (thread == 0) {
        sync(client, round % 2 == 0);
        client.uninstallAppUsingCoordination("com.a");
      }
      if (thread == 1) cancelAsUser("com.a");
      if (thread == 2) reportEverything(own);
      if (thread == 3) client.applicationInstallsDidCancel(cancelledRestore());
      if (thread == 4) {
        client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(own);
        reportEverything(own);
        client.dataMigratorCancelledCoordinatorForRestoreAppBundle(own);
      }
    }
  });
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(platform.coordination.abandoned().empty());

  sync(client, true);
  platform.coordination.waitUntilIdle();
  ASSERT_TRUE(platform.registry.app("com.a"));
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
}

/// Reports come one at a time, but not one at a time with the daemon's transfers: neither loses what the other writes.
TEST_F(CoordinationThreads, NoWordOfTheTodoListIsLost) {
  constexpr std::size_t kApps = 40;
  std::vector<std::string> identifiers;
  plist::Array entries;
  for (std::size_t number = 0; number < kApps; ++number) {
    identifiers.push_back("com.app" + std::to_string(number));
    entries.emplace_back(installEntry(identifiers.back()));
    platform.coordination.add(FakeCoordinator::of(identifiers.back()));
  }
  platform.files.put(kTodoListPath, binaryForm(std::move(entries)));
  AppsClient& client = makeDaemonClient();
  client.setupInstallCoordinatorObserver();
  runOnThreads(2, [&](std::size_t thread) {
    for (std::size_t number = thread; number < kApps; number += 2) {
      if (thread == 0) {
        platform.coordination.complete(identifiers[number]);
      } else {
        const auto sent = std::make_shared<platform::ZTAsset>(identifiers[number], "Application", "A");
        sent->setPath("package.zip");
        client.assetTransferSucceeded(sent, true, std::nullopt);
      }
    }
  });
  platform.coordination.waitUntilIdle();
  for (std::size_t number = 0; number < kApps; ++number) {
    EXPECT_EQ(operationWord(platform.files, identifiers[number]), number % 2 == 0 ? "INSTALLED" : "SENT");
  }
}

TEST_F(CoordinationThreads, TheObjectMayEndWhileTheServiceReports) {
  constexpr int kRounds = 50;
  for (int round = 0; round < kRounds; ++round) {
    makeDaemonClient().setupInstallCoordinatorObserver();
    auto client = takeClient();
    client->prepareAppForInstallUsingCoordination(asset, false);
    const std::string own = "com.round" + std::to_string(round);
    runOnThreads(3, [&](std::size_t thread) {
      if (thread == 0) client.reset();
      if (thread == 1) reportEverything(own);
      if (thread == 2) cancelAsUser("com.a");
    });
  }
  platform.coordination.waitUntilIdle();
  for (const auto& connection : platform.coordination.connections())
    EXPECT_FALSE(connection.isOpen);
  EXPECT_TRUE(platform.coordination.abandoned().empty());
}

/// Outside the daemon nothing ends the connection but the object's members, and reports are counted.
TEST_F(CoordinationThreads, OutsideTheDaemonTheObjectMayEndWhileTheServiceReports) {
  constexpr int kRounds = 50;
  for (int round = 0; round < kRounds; ++round) {
    makeClient().setupInstallCoordinatorObserver();
    auto client = takeClient();
    const std::string own = "com.round" + std::to_string(round);
    client->dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(own);
    runOnThreads(2, [&](std::size_t thread) {
      if (thread == 0) client.reset();
      if (thread == 1) reportEverything(own);
    });
  }
  platform.coordination.waitUntilIdle();
  for (const auto& connection : platform.coordination.connections())
    EXPECT_FALSE(connection.isOpen);
}

/// The service holds a share of the object while it reports to an observer, and may give it up last.
TEST_F(CoordinationThreads, AReportMayBeTheLastOwner) {
  makeClient();
  auto client = takeClient();
  client->prepareAppForInstallUsingCoordination(asset, false);
  platform.coordination.waitUntilIdle();
  platform.coordination.gate.close();
  // Holds the device service's answer back until the test has given its share up.
  class Holding final : public platform::ZTDeviceService {
   public:
    explicit Holding(Gate& gate) : gate_(gate) {}
    [[nodiscard]] bool supports(Operation) override { return true; }
    void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>&, Completion completion) override {
      gate_.pass();
      completion(std::nullopt);
    }
    void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>&) override {}

   private:
    Gate& gate_;
  };
  Gate gate;
  Holding service(gate);
  platform.use(service);
  gate.close();
  platform.coordination.gate.open();
  platform.coordination.prioritize("com.a");
  gate.waitUntilStopped(1);
  const std::weak_ptr<AppsClient> watched = client;
  client.reset();
  EXPECT_FALSE(watched.expired());
  gate.open();
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(watched.expired());
  EXPECT_TRUE(said("Prioritize com.a finished with error (null)"));
  EXPECT_EQ(platform.registry.observerCount(), 0U);
}

/// The registry reports from the moment of the registration, when the object does not know its mode yet.
TEST_F(CoordinationThreads, ACancelledInstallMayBeReportedWhileTheObjectIsMadeOrEnds) {
  constexpr int kRounds = 50;
  std::jthread reporting([this](const std::stop_token& stop) {
    while (!stop.stop_requested()) {
      platform.registry.add(FakeApp::placeholder("com.r", TSInstallType::Restore));
      if (const auto app = platform.registry.app("com.r"); app && app->progress) app->progress->cancel();
    }
  });
  for (int round = 0; round < kRounds; ++round) {
    makeClient();
    takeClient().reset();
  }
  reporting.request_stop();
  reporting.join();
  platform.registry.waitUntilReported();
  EXPECT_EQ(platform.registry.observerCount(), 0U);
}

}  // namespace
}  // namespace appsync::test
