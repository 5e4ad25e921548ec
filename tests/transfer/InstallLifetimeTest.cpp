// What queued installs keep alive, and for how long.
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/Gate.h"
#include "tests/support/ClientFixture.h"
#include "tests/support/NoMoreThreads.h"

namespace appsync::test {
namespace {

using platform::ZTAsset;

/// An asset whose last owner does not get rid of it before the gate opens.
class LingeringAsset final : public ZTAsset {
 public:
  LingeringAsset(std::string identifier, Gate& gate) : ZTAsset(std::move(identifier), "Application", {}), gate_(gate) {}
  ~LingeringAsset() override { gate_.pass(); }

 private:
  Gate& gate_;
};

/// Never blocks, but tells whether the first one to wait on it would have been.
class WaitProbe final : public Clock {
 public:
  TimePoint now() const override { return {}; }
  bool wait(std::condition_variable&, std::unique_lock<std::mutex>&, TimePoint,
            const std::function<bool()>& ready) override {
    const bool isReady = ready();
    if (!firstWaitBlocks) firstWaitBlocks = !isReady;
    return isReady;
  }

  std::optional<bool> firstWaitBlocks;
};

/// Drops every task, as a scheduler does that ends before they are due.
struct EndingScheduler final : Scheduler {
  void after(Duration, std::function<void()>) override {}
};

class InstallLifetime : public ClientFixture {
 protected:
  /// The same asset with its package.
  std::shared_ptr<ZTAsset> received(std::shared_ptr<ZTAsset> asset) {
    const std::string path = "/var/mobile/Media/PublicStaging/" + asset->identifier();
    platform.files.put(path, packageOf(asset->identifier(), "2.0"));
    asset->setPath(path);
    return asset;
  }

  /// So that a clock shows whether an install still counts at its last step.
  void endTransfersWhenThePackageIsRemoved(AppsClient& client) {
    platform.journal.setHook([&client](std::string_view operation, std::string_view) -> std::optional<Error> {
      if (operation == "fileSystem.removeItem") client.assetTransferEndedWithSuccess(true);
      return std::nullopt;
    });
  }
};

TEST_F(InstallLifetime, OnceTheTransfersHaveEndedNoInstallOwnsTheClientOrTheAsset) {
  Gate gate;
  gate.close();
  WaitProbe clock;
  platform.use(clock);
  AppsClient& client = makeClient();
  std::shared_ptr<ZTAsset> asset = received(std::make_shared<LingeringAsset>("com.a", gate));
  platform.registry.installGate.close();
  client._enqueueAssetInstall(asset);
  asset.reset();  // The install is its last owner now.
  platform.registry.installGate.open();
  gate.waitUntilStopped(1);

  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(clock.firstWaitBlocks, true) << "the transfers may end before the asset";
  const auto last = takeClient();
  EXPECT_EQ(last.use_count(), 1);
  gate.open();
}

TEST_F(InstallLifetime, ARetryThatIsDroppedIsNotWaitedFor) {
  WaitProbe clock;
  EndingScheduler scheduler;
  platform.use(clock);
  platform.use(scheduler);
  platform.screen.answerNext("com.a", {AssertionAnswer::denied()});
  AppsClient& client = makeClient();
  client._performAssetInstall(received(std::make_shared<ZTAsset>("com.a", "Application", "A")));
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(clock.firstWaitBlocks, false);
}

TEST_F(InstallLifetime, LeavesTheGroupLastWithoutAQueueThread) {
  if (!NoMoreThreads::arePossible()) GTEST_SKIP() << "this build starts threads in its own way";
  WaitProbe clock;
  platform.use(clock);
  AppsClient& client = makeClient();
  const auto asset = received(std::make_shared<ZTAsset>("com.a", "Application", "A"));
  endTransfersWhenThePackageIsRemoved(client);
  {
    const NoMoreThreads none;
    client._enqueueAssetInstall(asset);
  }
  platform.journal.setHook(nullptr);
  EXPECT_EQ(clock.firstWaitBlocks, true);
}

TEST_F(InstallLifetime, LeavesTheGroupLastWithoutASchedulerThread) {
  WaitProbe clock;
  ThreadlessScheduler scheduler;
  platform.use(clock);
  platform.use(scheduler);
  platform.screen.answerNext("com.a", {AssertionAnswer::denied()});
  AppsClient& client = makeClient();
  const auto asset = received(std::make_shared<ZTAsset>("com.a", "Application", "A"));
  endTransfersWhenThePackageIsRemoved(client);
  client._performAssetInstall(asset);
  platform.journal.setHook(nullptr);
  EXPECT_EQ(clock.firstWaitBlocks, true);
}

TEST_F(InstallLifetime, QueuedInstallsKeepTheClientAliveAndItEndsOnTheirThread) {
  AppsClient& client = makeClient();
  platform.registry.installGate.close();
  client._enqueueAssetInstall(received(std::make_shared<ZTAsset>("com.a", "Application", "A")));
  platform.registry.installGate.waitUntilStopped(1);
  takeClient().reset();
  EXPECT_EQ(platform.backups.connections(), 1U);
  platform.registry.installGate.open();
  platform.backups.waitUntilReleased();
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
}

}  // namespace
}  // namespace appsync::test
