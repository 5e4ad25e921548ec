// How long a restore waits for its placeholders.
#include <atomic>
#include <chrono>
#include <memory>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "tests/restore/RestoreFixture.h"

namespace appsync::test {
namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;

class RestoreWait : public CoordinatedRestoreFixture {
 protected:
  void SetUp() override {
    CoordinatedRestoreFixture::SetUp();
    putRestoreInfo({{"com.a", restoredApp()}, {"com.b", restoredApp()}, {"com.c", restoredApp()}});
  }

  /// Runs the restore on a thread of its own until it waits.
  std::thread restore(AppsClient& client) {
    std::thread daemon([this, &client] { result = client._processHarvoRestoreInfo(); });
    platform.time.waitUntilWaiting(1);
    return daemon;
  }

  /// Lets go of a client whose placeholders never came.
  void release() {
    takeClient().reset();
    platform.coordination.waitUntilIdle();
  }

  std::atomic<bool> result = false;
};

TEST_F(RestoreWait, ThreePlaceholdersAreWorthFifteenSeconds) {
  AppsClient& client = makeClient();
  const TimePoint start = platform.time.now();
  std::thread daemon = restore(client);
  EXPECT_TRUE(said("Will wait for 15 seconds for 3 placeholders to install"));
  platform.time.advance(seconds(15) - milliseconds(1));
  EXPECT_FALSE(said("Finished waiting for placeholder installs"));
  platform.time.waitUntilWaiting(1);
  platform.time.advance(milliseconds(1));
  daemon.join();
  EXPECT_EQ(platform.time.now() - start, seconds(15));
  EXPECT_TRUE(said("Finished waiting for placeholder installs"));
  EXPECT_TRUE(result);
  expectFiledAway();
  release();
}

TEST_F(RestoreWait, EndsWithTheLastPlaceholder) {
  AppsClient& client = makeClient();
  const TimePoint start = platform.time.now();
  std::thread daemon = restore(client);
  for (const char* identifier : {"com.b", "com.a", "com.c"})
    platform.coordination.didInstallPlaceholder(identifier);
  daemon.join();
  EXPECT_EQ(platform.time.now(), start);
  EXPECT_TRUE(said("CN finished installing placeholder for com.c, _restoringPlaceholderCount 0"));
  EXPECT_TRUE(result);
}

TEST_F(RestoreWait, PlaceholdersThatCameMeanwhileAreNotWaitedFor) {
  platform.coordination.installAutomatically();
  AppsClient& client = makeClient();
  std::thread daemon([this, &client] { result = client._processHarvoRestoreInfo(); });
  daemon.join();
  EXPECT_TRUE(result);
  EXPECT_TRUE(platform.registry.app("com.c")->isPlaceholder);
}

TEST_F(RestoreWait, AWithdrawalEndsItToo) {
  AppsClient& client = makeClient();
  std::thread daemon = restore(client);
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    client.dataMigratorCancelledCoordinatorForRestoreAppBundle(identifier);
  daemon.join();
  EXPECT_TRUE(said("Finished waiting for placeholder installs"));
}

TEST_F(RestoreWait, LaterReportsAreIgnoredAndWithdrawalsStillCount) {
  AppsClient& client = makeClient();
  std::thread daemon = restore(client);
  platform.time.advance(seconds(15));
  daemon.join();
  platform.log.clear();
  platform.coordination.didInstallPlaceholder("com.a");
  platform.coordination.waitUntilIdle();
  client.cnDidInstallPlaceHolderForAppBundle("com.unknown");
  EXPECT_TRUE(
      sameLines({logged("coordinatorDidInstallPlaceholder for com.a with error (null)")}, platform.log.lines()));
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.a");
  EXPECT_TRUE(said("DataMigrator cancelled coordinator for restoring app bundle com.a _restoringPlaceholderCount 2"));
  release();
  EXPECT_TRUE(complained(
      "<AppsClient> getting dealloc'd with (com.b, com.c)pending placeholder install complete notifications"));
}

TEST_F(RestoreWait, InsideTheDaemonPlaceholdersDoNotEndIt) {
  AppsClient& client = makeDaemonClient();
  const TimePoint start = platform.time.now();
  std::thread daemon = restore(client);
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    platform.coordination.didInstallPlaceholder(identifier);
  platform.coordination.waitUntilIdle();
  for (const std::string& message : platform.log.messages())
    EXPECT_EQ(message.find("CN finished installing placeholder"), std::string::npos) << message;
  platform.time.advance(seconds(15) - milliseconds(1));
  platform.time.waitUntilWaiting(1);
  platform.time.advance(milliseconds(1));
  daemon.join();
  EXPECT_EQ(platform.time.now() - start, seconds(15));
  EXPECT_TRUE(said("Finished waiting for placeholder installs"));
  release();
}

TEST_F(RestoreWait, InsideTheDaemonWithdrawalsEndIt) {
  AppsClient& client = makeDaemonClient();
  const TimePoint start = platform.time.now();
  std::thread daemon = restore(client);
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    client.dataMigratorCancelledCoordinatorForRestoreAppBundle(identifier);
  daemon.join();
  EXPECT_EQ(platform.time.now(), start);
  EXPECT_TRUE(said("Finished waiting for placeholder installs"));
}

TEST_F(RestoreWait, WithoutCoordinationThereIsNothingToWaitFor) {
  auto direct = std::make_unique<FakePlatform>();
  direct->files.putFolder(kLogFolder);
  direct->files.put(kRestoreInfo, binaryForm(plist::Dictionary{{"com.a", restoredApp()}}));
  auto client = AppsClient::create(*direct);
  EXPECT_TRUE(client->_processHarvoRestoreInfo());
  EXPECT_TRUE(direct->log.contains(logged("Will wait for 0 seconds for 0 placeholders to install")));
}

TEST_F(RestoreWait, TheFileIsFiledAwayOnlyAfterIt) {
  AppsClient& client = makeClient();
  std::thread daemon = restore(client);
  EXPECT_TRUE(platform.files.has(kRestoreInfo));
  platform.time.advance(seconds(15));
  daemon.join();
  expectFiledAway();
  release();
}

/// A whole restore of two apps on a device of its own.
class FaultyRestore {
 public:
  FaultyRestore() {
    platform.coordination.enable();
    platform.files.putFolder(kLogFolder);
    platform.files.put(kRestoreInfo, binaryForm(plist::Dictionary{{"com.a", restoredApp()}, {"com.b", restoredApp()}}));
    client = AppsClient::create(platform);
  }

  enum class Wait { none, untilTheDeadline };

  /// Ends within the ten seconds that two apps are worth.
  void run(Wait wait) {
    std::thread daemon([this] { EXPECT_TRUE(client->reconcileRestoreOfType(kHostRestore, nullptr)); });
    if (wait == Wait::untilTheDeadline) {
      platform.time.waitUntilWaiting(1);
      platform.time.advance(seconds(10));
    }
    daemon.join();
  }

  FakePlatform platform;
  std::shared_ptr<AppsClient> client;
};

std::vector<std::string> callsOfARestore() {
  std::vector<std::string> calls;
  FaultyRestore restore;
  restore.platform.journal.setHook([&calls](std::string_view operation, std::string_view arguments) {
    calls.push_back(std::string(operation).append(" ").append(arguments));
    return std::nullopt;
  });
  restore.run(FaultyRestore::Wait::untilTheDeadline);
  restore.platform.journal.setHook(nullptr);
  return calls;
}

/// Each call of a whole restore fails in turn: it ends within its bound, the file is in one place, and what is counted
/// can be counted down again.
TEST_F(RestoreWait, WhicheverCallFailsTheRestoreEndsInTime) {
  const std::vector<std::string> calls = callsOfARestore();
  EXPECT_GT(calls.size(), 50U);
  for (std::size_t number = 1; number <= calls.size(); ++number) {
    const std::string& call = calls[number - 1];
    SCOPED_TRACE(call);
    FaultyRestore restore;
    FakePlatform& device = restore.platform;
    device.journal.failCall(number, error);
    const bool isFound = call != "fileSystem.fileExists " + std::string(kRestoreInfo);
    const bool isRead = isFound && call != "fileSystem.readFile " + std::string(kRestoreInfo);
    restore.run(isRead ? FaultyRestore::Wait::untilTheDeadline : FaultyRestore::Wait::none);
    device.journal.setHook(nullptr);

    const bool isMoved = isFound && !call.starts_with("fileSystem.moveItem ");
    EXPECT_EQ(device.files.has(kFiledRestoreInfo), isMoved);
    EXPECT_EQ(device.files.has(kRestoreInfo), !isMoved);
    EXPECT_TRUE(device.coordination.abandoned().empty());
    for (const FakeCoordinator& coordinator : device.coordination.coordinators()) {
      EXPECT_TRUE(coordinator.placeholder);
      restore.client->dataMigratorCancelledCoordinatorForRestoreAppBundle(coordinator.identifier);
    }
    device.log.clear();
    restore.client->dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.counted");
    EXPECT_TRUE(
        device.log.contains(logged("DataMigrator will wait for CN to install placeholder for com.counted, "
                                   "_restoringPlaceholderCount 1")));
  }
}

}  // namespace
}  // namespace appsync::test
