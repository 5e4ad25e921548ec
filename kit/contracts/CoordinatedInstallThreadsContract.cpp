// CoordinatedInstallContract: thread safety.
#include <atomic>
#include <memory>
#include <string>
#include <vector>

#include "kit/contracts/CoordinationListener.h"
#include "kit/contracts/EventCounter.h"
#include "kit/contracts/InstallCoordinationContract.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::FileLocation;
using platform::IfMissing;
using platform::UserConfirmation;

namespace {

constexpr std::size_t kThreads = 6;
constexpr std::string_view kServiceName = "com.corvel.contract.observer";

std::string appOf(std::size_t index, int round) {
  return "com.app" + std::to_string(index) + "x" + std::to_string(round);
}

}  // namespace

TEST_P(CoordinatedInstallContract, OneOfManyThreadsCreatesTheCoordinator) {
  for (int round = 0; round < 10; ++round) {
    std::atomic<int> made = 0;
    runOnThreads(kThreads, [&](std::size_t) {
      bool created = false;
      EXPECT_NE(
          service().coordinatorForApp(Kind::initiating, appOf(0, round), kSync, IfMissing::create, &created, nullptr),
          nullptr);
      if (created) ++made;
    });
    EXPECT_EQ(made, 1);
  }
}

TEST_P(CoordinatedInstallContract, OneOfManyThreadsSetsAValue) {
  const Coordinator made = coordinator("com.a");
  std::atomic<int> options = 0;
  std::atomic<int> assets = 0;
  std::atomic<int> placeholders = 0;
  runOnThreads(kThreads, [&](std::size_t) {
    const Coordinator handle = find("com.a");
    options += handle->setInstallOptions(CoordinatedInstallContract::options()).ok() ? 1 : 0;
    assets += handle->setAppAssetPromise(makeAsset()).ok() ? 1 : 0;
    placeholders += handle->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")).ok() ? 1 : 0;
  });
  EXPECT_EQ(options, 1);
  EXPECT_EQ(assets, 1);
  EXPECT_EQ(placeholders, 1);
}

TEST_P(CoordinatedInstallContract, OneOfManyCoordinatorsGetsAPromise) {
  const Asset asset = makeAsset();
  std::atomic<int> attached = 0;
  runOnThreads(kThreads, [&](std::size_t index) {
    attached += coordinator(appOf(index, 0))->setAppAssetPromise(asset).ok() ? 1 : 0;
  });
  EXPECT_EQ(attached, 1);
}

TEST_P(CoordinatedInstallContract, OneOfManyThreadsCancels) {
  CoordinationListener listener;
  const auto connection = service().initWithMachServiceName(kServiceName, {kSync}, listener);
  const Coordinator made = coordinator("com.a");
  std::atomic<int> cancelled = 0;
  runOnThreads(kThreads, [&](std::size_t) { cancelled += made->cancelForReason(reason(), kStore).ok() ? 1 : 0; });
  subject().waitUntilIdle();
  EXPECT_EQ(cancelled, 1);
  EXPECT_EQ(listener.events(), std::vector<std::string>{"cancelled com.a by 1 for ZTError 30"});
}

TEST_P(CoordinatedInstallContract, CancellationDuringInstallIsAtomic) {
  for (int round = 0; round < 10; ++round) {
    const std::string identifier = appOf(0, round);
    const Coordinator made = coordinator(identifier);
    const Asset asset = prepare(*made);
    const FileLocation package = subject().makePackage(identifier, "1.0");
    asset->setTransferPath(package);
    std::atomic<bool> wasCancelled = false;
    runOnThreads(2, [&](std::size_t index) {
      if (index == 0) asset->setComplete(true);
      if (index == 1) wasCancelled = cancel(*made).ok();
    });
    subject().waitUntilIdle();
    EXPECT_EQ(find(identifier), nullptr);
    EXPECT_EQ(stateOf(identifier), wasCancelled ? "absent" : "installed");
    EXPECT_EQ(made->coordinatorError(), wasCancelled ? std::optional(reason()) : std::nullopt);
    // If the cancellation wins, either side may own the package: the promise may not have been complete yet.
    if (!wasCancelled) {
      EXPECT_FALSE(subject().exists(package));
    }
  }
}

TEST_P(CoordinatedInstallContract, InstallsAppsWhileConnectionsOpenAndClose) {
  constexpr int kRounds = 3;
  CoordinationListener all;
  const auto connection = service().initWithMachServiceName(kServiceName, {kSync}, all);
  std::atomic<std::size_t> busy = kThreads;
  runOnThreads(kThreads + 2, [&](std::size_t index) {
    if (index >= kThreads) {
      while (busy != 0) {
        CoordinationListener passing;
        const auto passer = service().initWithMachServiceName(kServiceName, {kSync, kStore}, passing);
        static_cast<void>(find(appOf(0, 0)));
      }
      return;
    }
    for (int round = 0; round < kRounds; ++round) {
      const auto observer = std::make_shared<CoordinationListener>();
      const Coordinator made = coordinator(appOf(index, round));
      made->setObserver(observer);
      deliver(*prepare(*made), subject().makePackage(appOf(index, round), "1.0"));
    }
    --busy;
  });
  subject().waitUntilIdle();
  for (std::size_t index = 0; index < kThreads; ++index) {
    for (int round = 0; round < kRounds; ++round) {
      EXPECT_EQ(stateOf(appOf(index, round)), "installed");
      EXPECT_EQ(find(appOf(index, round)), nullptr);
      EXPECT_EQ(all.count("placeholder " + appOf(index, round)), 1U);
      EXPECT_EQ(all.count("complete " + appOf(index, round)), 1U);
    }
  }
}

TEST_P(CoordinatedInstallContract, CoordinatorIsThreadSafe) {
  EventCounter completions;
  runOnThreads(kThreads, [&](std::size_t index) {
    for (int round = 0; round < 5; ++round) {
      bool created = false;
      const Coordinator handle =
          service().coordinatorForApp(Kind::initiating, "com.a", kSync, IfMissing::create, &created, nullptr);
      ASSERT_NE(handle, nullptr);
      handle->setObserver(std::make_shared<CoordinationListener>());
      handle->setInstallOptions(options()).ignore();
      handle->setPlaceholderPromise(makeConfiguredPlaceholder("com.a")).ignore();
      handle->setAppAssetPromise(makeAsset()).ignore();
      if (index % 3 == 0) cancel(*handle).ignore();
      if (index % 3 == 1) {
        service().uninstallApp("com.a", UserConfirmation::skip,
                               [&](const std::optional<Error>&) { completions.add(); });
      }
      if (const Asset asset = handle->appAssetPromise()) asset->setPercentComplete(0.5);
    }
  });
  EXPECT_TRUE(completions.waitFor(10));
  if (const Coordinator left = find("com.a")) {
    EXPECT_TRUE(cancel(*left));
  }
  subject().waitUntilIdle();
  EXPECT_EQ(completions.count(), 10U);
  EXPECT_EQ(find("com.a"), nullptr);
  EXPECT_EQ(stateOf("com.a"), "absent");
  install("com.a", "1.0");
}

}  // namespace appsync::test
