// What queued installs keep alive, and for how long.
#include <condition_variable>
#include <functional>
#include <future>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/Gate.h"
#include "tests/ClientFixture.h"

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

/// Tells whether the first one to wait on it had anything to wait for.
class WatchedClock final : public Clock {
 public:
  explicit WatchedClock(Clock& clock) : clock_(clock) {}
  TimePoint now() const override { return clock_.now(); }
  bool wait(std::condition_variable& condition, std::unique_lock<std::mutex>& lock, TimePoint deadline,
            const std::function<bool()>& ready) override {
    std::call_once(first_, [&] { firstWait_.set_value(!ready()); });
    return clock_.wait(condition, lock, deadline, ready);
  }

  /// Blocks until somebody waits.
  [[nodiscard]] bool firstWaitWasNeeded() { return firstWait_.get_future().get(); }

 private:
  Clock& clock_;
  std::once_flag first_;
  std::promise<bool> firstWait_;
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
};

TEST_F(InstallLifetime, OnceTheTransfersHaveEndedNoInstallOwnsTheClientOrTheAsset) {
  Gate gate;
  gate.close();
  WatchedClock clock(platform.time);
  platform.use(clock);
  AppsClient& client = makeClient();
  std::shared_ptr<ZTAsset> asset = received(std::make_shared<LingeringAsset>("com.a", gate));
  platform.registry.installGate.close();
  client._enqueueAssetInstall(asset);
  asset.reset();  // The install is its last owner now.
  platform.registry.installGate.open();
  gate.waitUntilStopped(1);
  const auto last = takeClient();
  EXPECT_EQ(last.use_count(), 1);

  auto ended = std::async(std::launch::async, [&client] { client.assetTransferEndedWithSuccess(true); });
  EXPECT_TRUE(clock.firstWaitWasNeeded()) << "the transfers ended before the asset";
  gate.open();
  ended.get();
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
