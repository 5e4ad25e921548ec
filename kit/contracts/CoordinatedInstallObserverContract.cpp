// CoordinatedInstallContract: observers and connections.
#include <atomic>
#include <future>
#include <memory>
#include <set>
#include <thread>

#include "kit/contracts/CoordinationListener.h"
#include "kit/contracts/EventCounter.h"
#include "kit/contracts/InstallCoordinationContract.h"
#include "kit/fakes/Patience.h"

namespace appsync::test {

using platform::ClientIdentity;
using platform::InstallCoordinator;

namespace {

using Lines = std::vector<std::string>;
using Connection = std::unique_ptr<platform::InstallObserver>;

constexpr std::string_view kServiceName = "com.corvel.contract.observer";

Connection connect(platform::InstallCoordination& service, platform::InstallObserverDelegate& delegate,
                   const std::set<ClientIdentity>& clients = {ClientIdentity::CXClientSync}) {
  Connection connection = service.initWithMachServiceName(kServiceName, clients, delegate);
  EXPECT_NE(connection, nullptr);
  return connection;
}

}  // namespace

// Events.

TEST_P(CoordinatedInstallContract, ReportsPlaceholderAndCompletion) {
  CoordinationListener listener;
  const Connection connection = connect(service(), listener);
  const Asset asset = prepare(*coordinator("com.a"));
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{"placeholder com.a"});
  EXPECT_NE(listener.thread(), std::this_thread::get_id());
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), (Lines{"placeholder com.a", "complete com.a"}));
}

TEST_P(CoordinatedInstallContract, ReportsFailedInstallAsCompleteWithError) {
  CoordinationListener listener;
  const Connection connection = connect(service(), listener);
  const Asset asset = prepare(*coordinator("com.a"));
  subject().waitUntilIdle();
  deliver(*asset, subject().makeDamagedPackage("com.a"));
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), (Lines{"placeholder com.a", "complete com.a with error"}));
}

TEST_P(CoordinatedInstallContract, NoOperationWaitsForACallback) {
  std::promise<void> done;
  const std::shared_future<void> end = done.get_future().share();
  CoordinationListener listener([&end](InstallCoordinator&) { awaitReady(end, "an operation waits for a callback"); });
  const Connection connection = connect(service(), listener);
  const Asset asset = prepare(*coordinator("com.a"));
  done.set_value();
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{"placeholder com.a"});
}

TEST_P(CoordinatedInstallContract, ReportsActionsOfTheUser) {
  CoordinationListener listener;
  const Connection connection = connect(service(), listener);
  const Asset asset = prepare(*coordinator("com.a"));
  subject().waitUntilIdle();
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  subject().cancelByUser("com.a");
  subject().waitUntilIdle();
  const Lines events = listener.events();
  ASSERT_EQ(events.size(), 3U);
  EXPECT_EQ(events[1], "prioritize com.a");
  EXPECT_TRUE(events[2].starts_with("cancelled com.a by 2 for ")) << events[2];
}

TEST_P(CoordinatedInstallContract, ReportsCancellationByAnotherClient) {
  CoordinationListener listener;
  const Connection connection = connect(service(), listener);
  EXPECT_TRUE(coordinator("com.a")->cancelForReason(reason(), kStore));
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{"cancelled com.a by 1 for ZTError 30"});
}

TEST_P(CoordinatedInstallContract, DoesNotReportCancellationByTheCreator) {
  CoordinationListener listener;
  const Connection connection = connect(service(), listener);
  EXPECT_TRUE(cancel(*coordinator("com.a")));
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{});
}

TEST_P(CoordinatedInstallContract, ReportsEventsOfAnAppInOrder) {
  CoordinationListener listener;
  const Connection connection = connect(service(), listener);
  const Asset asset = prepare(*coordinator("com.a"));
  subject().prioritize("com.a");
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(listener.count("placeholder com.a"), 1U);
  EXPECT_EQ(listener.count("prioritize com.a"), 1U);
  EXPECT_EQ(listener.events().back(), "complete com.a");
}

TEST_P(CoordinatedInstallContract, PassesTheCoordinatorToTheCallback) {
  CoordinationListener listener([](InstallCoordinator& reported) {
    EXPECT_EQ(reported.kind(), Kind::updating);
    EXPECT_EQ(reported.creatorIdentifier(), kSync);
    EXPECT_TRUE(reported.hasPlaceholderPromise());
    EXPECT_FALSE(reported.description().empty());
  });
  const Connection connection = connect(service(), listener);
  EXPECT_TRUE(coordinator("com.a", Kind::updating)->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")));
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{"placeholder com.a"});
}

// Observers.

TEST_P(CoordinatedInstallContract, ConnectionReportsItsClientsCoordinatorsOnly) {
  CoordinationListener syncs;
  CoordinationListener stores;
  CoordinationListener both;
  CoordinationListener nobodys;
  const Connection first = connect(service(), syncs, {kSync});
  const Connection second = connect(service(), stores, {kStore});
  const Connection third = connect(service(), both, {kSync, kStore});
  const Connection fourth = connect(service(), nobodys, {});
  const Coordinator own = coordinator("com.a");
  const Coordinator foreign = coordinator("com.b", Kind::initiating, kStore);
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  subject().prioritize("com.b");
  subject().waitUntilIdle();
  EXPECT_EQ(syncs.events(), Lines{"prioritize com.a"});
  EXPECT_EQ(stores.events(), Lines{"prioritize com.b"});
  EXPECT_EQ(both.events(), (Lines{"prioritize com.a", "prioritize com.b"}));
  EXPECT_EQ(nobodys.events(), Lines{});
}

TEST_P(CoordinatedInstallContract, CoordinatorReportsToItsObserver) {
  const auto observer = std::make_shared<CoordinationListener>();
  coordinator("com.a")->setObserver(observer);
  const Coordinator other = coordinator("com.b");
  subject().prioritize("com.a");
  subject().prioritize("com.b");
  subject().waitUntilIdle();
  EXPECT_EQ(observer->events(), Lines{"prioritize com.a"});
}

TEST_P(CoordinatedInstallContract, ObserverWithConnectionIsNotifiedOnce) {
  const auto observer = std::make_shared<CoordinationListener>();
  const Connection connection = connect(service(), *observer);
  const Coordinator made = coordinator("com.a");
  made->setObserver(observer);
  made->setObserver(observer);
  const Asset asset = prepare(*made);
  deliver(*asset, subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(observer->events(), (Lines{"placeholder com.a", "complete com.a"}));
}

TEST_P(CoordinatedInstallContract, LaterObserverReplacesEarlierObserver) {
  const auto earlier = std::make_shared<CoordinationListener>();
  const auto later = std::make_shared<CoordinationListener>();
  const Coordinator made = coordinator("com.a");
  made->setObserver(earlier);
  made->setObserver(later);
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  EXPECT_EQ(earlier->events(), Lines{});
  EXPECT_EQ(later->events(), Lines{"prioritize com.a"});
}

TEST_P(CoordinatedInstallContract, DestroyedObserverIsIgnored) {
  auto observer = std::make_shared<CoordinationListener>();
  const Coordinator made = coordinator("com.a");
  made->setObserver(observer);
  observer.reset();
  subject().prioritize("com.a");
  deliver(*prepare(*made), subject().makePackage("com.a", "1.0"));
  subject().waitUntilIdle();
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(CoordinatedInstallContract, ObserverIsNotifiedAfterItsConnectionCloses) {
  const auto observer = std::make_shared<CoordinationListener>();
  Connection connection = connect(service(), *observer);
  coordinator("com.a")->setObserver(observer);
  connection.reset();
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  EXPECT_EQ(observer->events(), Lines{"prioritize com.a"});
}

// Connections.

TEST_P(CoordinatedInstallContract, ClosedConnectionReportsNothing) {
  CoordinationListener listener;
  CoordinationListener witness;
  Connection connection = connect(service(), listener);
  const Connection open = connect(service(), witness);
  const Coordinator made = coordinator("com.a");
  connection.reset();
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{});
  EXPECT_EQ(witness.events(), Lines{"prioritize com.a"});
}

TEST_P(CoordinatedInstallContract, ClosingAConnectionWaitsForItsCallback) {
  EventCounter begun;
  EventCounter mayEnd;
  std::atomic<bool> hasEnded = false;
  CoordinationListener listener([&](InstallCoordinator&) {
    begun.add();
    static_cast<void>(mayEnd.waitFor(1));
    hasEnded = true;
  });
  Connection connection = connect(service(), listener);
  const Coordinator made = coordinator("com.a");
  subject().prioritize("com.a");
  ASSERT_TRUE(begun.waitFor(1));
  std::jthread closer([&] {
    connection.reset();
    EXPECT_TRUE(hasEnded);
  });
  mayEnd.add();
}

TEST_P(CoordinatedInstallContract, ConnectionCanCloseInItsCallback) {
  Connection connection;
  CoordinationListener listener([&](InstallCoordinator&) { connection.reset(); });
  connection = connect(service(), listener);
  const Coordinator made = coordinator("com.a");
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{"prioritize com.a"});
}

TEST_P(CoordinatedInstallContract, CallbackCanCallTheService) {
  CoordinationListener listener([&](InstallCoordinator& reported) {
    if (reported.bundleID() != "com.a") return;
    EXPECT_NE(find("com.a"), nullptr);
    EXPECT_TRUE(coordinator("com.b")->setInstallOptions(options()));
    EXPECT_TRUE(reported.setInitialODRAssetPromises({}));
    EXPECT_TRUE(cancel(reported));
    CoordinationListener other;
    const Connection inner = connect(service(), other);
  });
  const Connection connection = connect(service(), listener);
  const Coordinator made = coordinator("com.a");
  subject().prioritize("com.a");
  subject().waitUntilIdle();
  EXPECT_EQ(listener.events(), Lines{"prioritize com.a"});
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_NE(find("com.b"), nullptr);
}

}  // namespace appsync::test
