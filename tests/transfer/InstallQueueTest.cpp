// Installing received packages: assertions, retries, outcomes, and ten at a time.
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <future>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/Patience.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/NoMoreThreads.h"
#include "tests/transfer/InstallQueueFixture.h"

namespace appsync::test {
namespace {

TEST_F(InstallQueue, AGrantedInstallIsHeldInstalledRecordedAndCleanedUp) {
  writeTodoList({"com.a"});
  writeRestoreState("com.a");
  const auto asset = receive("com.a");
  AppsClient& client = makeClient();
  client._enqueueAssetInstall(asset);
  client.assetTransferEndedWithSuccess(true);

  EXPECT_TRUE(sameLines({logged("Enqueue install request for com.a"), logged("Performing install for com.a"),
                         logged("Grabbing assertion for com.a"), logged("Assertion succeeded for com.a"),
                         logged("com.a install succeeded"), logged("Changing com.a from DOWNLOADED to INSTALLED"),
                         logged("Finished install for com.a")},
                        [&] {
                          LogLines lines;
                          for (const LogLine& line : platform.log.lines(8)) {
                            if (line.text.find("com.a") != std::string::npos) lines.push_back(line);
                          }
                          return lines;
                        }()));
  EXPECT_EQ(transactionsOf("com.a"), Strings{"Asset install: assertion succeeded y"});
  EXPECT_EQ(operationWord(platform.files, "com.a"), "INSTALLED");
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
  EXPECT_FALSE(platform.files.has(kRestoreStatePath));
}

TEST_F(InstallQueue, TheStepsOfAnInstallComeInOrder) {
  writeTodoList({"com.a"});
  performInstall(receive("com.a"));
  EXPECT_EQ(platform.journal.lines(
                {"homeScreen.", "transactionLog.", "registry.install", "fileSystem.write", "fileSystem.removeItem"}),
            (Strings{"homeScreen.terminationAssertionCreate com.a",
                     "transactionLog.logScenario Asset install com.a y assertion succeeded",
                     "registry.installApplication com.a " + pathOf("com.a"),
                     "fileSystem.writeFileAtomically " + std::string(kTodoListPath), "homeScreen.release com.a",
                     "fileSystem.removeItem " + pathOf("com.a")}));
}

TEST_F(InstallQueue, ThePackageIsInstalledAsACustomersUnderItsIdentifier) {
  performInstall(receive("com.a"));
  const auto installs = platform.registry.installs();
  ASSERT_EQ(installs.size(), 1U);
  EXPECT_EQ(installs[0].location, (platform::FileLocation{pathOf("com.a"), false}));
  EXPECT_EQ(installs[0].options, (plist::Dictionary{{"PackageType", "Customer"}, {"BundleIdentifier", "com.a"}}));
}

TEST_F(InstallQueue, AnAppUnknownToTheHomeScreenIsInstalledAnywayAndTheStepIsASuccess) {
  platform.screen.answerAlways("com.a", AssertionAnswer::notFound());
  AppsClient& client = performInstall(receive("com.a"));
  EXPECT_TRUE(platform.log.contains(logged("Assertion not found for com.a, installing anyway...")));
  EXPECT_EQ(transactionsOf("com.a"), Strings{"Asset install: assertion not found y"});
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 1);
}

TEST_F(InstallQueue, AnInstallForWhichTheSystemHasNoThreadHasFailed) {
  if (!NoMoreThreads::arePossible()) GTEST_SKIP() << "this build starts threads in its own way";
  AppsClient& client = makeClient();
  const auto asset = receive("com.a");
  {
    const NoMoreThreads none;
    client._enqueueAssetInstall(asset);
  }
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(platform.log.contains(logged("com.a install failed unrecoverably: " + description(kNoThread))));
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
}

TEST_F(InstallQueue, DenialWithoutASchedulerThreadFailsTheInstall) {
  ThreadlessScheduler scheduler;
  platform.use(scheduler);
  writeTodoList({"com.a"});
  writeRestoreState("com.a");
  platform.screen.answerNext("com.a", {AssertionAnswer::denied()});
  AppsClient& client = makeClient();
  client._enqueueAssetInstall(receive("com.a"));
  client.assetTransferEndedWithSuccess(true);
  EXPECT_TRUE(platform.log.contains(logged("com.a install failed unrecoverably: " + description(kNoThread))));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "FAILED");
  EXPECT_FALSE(platform.files.has(kRestoreStatePath));
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 0);
}

TEST_F(InstallQueue, RecoverableLackOfASchedulerThreadKeepsTheEntry) {
  ThreadlessScheduler scheduler;
  platform.use(scheduler);
  writeTodoList({"com.a"});
  platform.framework.judgeErrorsBy([](const Error& error) { return error.code == EAGAIN; });
  platform.screen.answerNext("com.a", {AssertionAnswer::denied()});
  performInstall(receive("com.a"));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "DOWNLOADED");
  EXPECT_TRUE(platform.registry.uninstalls().empty());
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
}

TEST_F(InstallQueue, OutcomeThatIsNotSetIsNoGrant) {
  ForgetfulHomeScreen screen;
  platform.use(screen);
  performInstall(receive("com.a"));
  EXPECT_TRUE(platform.log.contains(loggedError("Unknown error 255 getting assertion for com.a")));
  EXPECT_EQ(transactionsOf("com.a").front(), "Asset install: unknown error grabbing assertion n");
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
}

TEST_F(InstallQueue, AssetWithoutAPathRemovesNoFile) {
  for (const auto& path : {std::optional<std::string>(), std::optional<std::string>("")}) {
    const auto asset = receive("com.a");
    asset->setPath(path);
    performInstall(asset);
  }
  EXPECT_EQ(platform.journal.count("fileSystem.removeItem"), 0U);
}

TEST_F(InstallQueue, ADeniedAssertionLeavesThePackageCleansTheRestoreStateAndCountsNoAttempt) {
  writeRestoreState("com.a");
  platform.screen.answerNext("com.a", {AssertionAnswer::denied()});
  AppsClient& client = makeClient();
  client._enqueueAssetInstall(receive("com.a"));
  platform.time.waitUntilScheduled(1);
  auto ended = std::async(std::launch::async, [&client] { client.assetTransferEndedWithSuccess(true); });

  EXPECT_TRUE(platform.log.contains(loggedError("Assertion denied for com.a")));
  EXPECT_TRUE(platform.log.contains(loggedError("Will retry installation of com.a in 30 seconds")));
  EXPECT_EQ(transactionsOf("com.a"),
            (Strings{"Asset install: assertion denied y", "Asset install: retrying asset install y"}));
  EXPECT_TRUE(platform.files.has(pathOf("com.a")));
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 0);

  platform.time.advance(30s);
  awaitReady(ended, "the transfer does not end");
  ended.get();
  EXPECT_FALSE(platform.files.has(kRestoreStatePath));
  EXPECT_TRUE(platform.log.contains(loggedError("Re-enqueue installation request for com.a")));
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
}

TEST_F(InstallQueue, ADeniedAttemptCleansTheRestoreStateWithoutWaitingForTheNext) {
  writeRestoreState("com.a");
  platform.screen.answerAlways("com.a", AssertionAnswer::denied());
  std::promise<void> cleaned;
  platform.journal.setHook([&](std::string_view operation, std::string_view path) -> std::optional<Error> {
    if (operation == "fileSystem.removeItem" && path == kRestoreStatePath) cleaned.set_value();
    return std::nullopt;
  });
  AppsClient& client = makeClient();
  client._enqueueAssetInstall(receive("com.a"));
  awaitReady(cleaned.get_future(), "the restore state is not cleaned");
  EXPECT_EQ(platform.time.pendingTasks(), 1U) << "the next attempt is scheduled before the state is cleaned";
  EXPECT_TRUE(platform.files.has(pathOf("com.a")));

  platform.journal.setHook(nullptr);
  platform.screen.answerAlways("com.a", AssertionAnswer::granted());
  platform.time.advance(30s);
  client.assetTransferEndedWithSuccess(true);
}

TEST_F(InstallQueue, ADeniedInstallIsTriedAgainAfterExactlyThirtySecondsForAsLongAsItIsDenied) {
  constexpr int kDenials = 7;
  platform.screen.answerAlways("com.a", AssertionAnswer::denied());
  AppsClient& client = makeClient();
  client._enqueueAssetInstall(receive("com.a"));
  auto ended = std::async(std::launch::async, [&client] { client.assetTransferEndedWithSuccess(true); });

  for (int denial = 1; denial <= kDenials; ++denial) {
    platform.time.waitUntilScheduled(1);
    EXPECT_EQ(platform.journal.count("homeScreen.terminationAssertionCreate"), static_cast<std::size_t>(denial));
    platform.time.advance(30s - 1ns);
    EXPECT_EQ(platform.time.pendingTasks(), 1U) << "tried again too early";
    EXPECT_EQ(ended.wait_for(0s), std::future_status::timeout) << "the transfer's end did not wait";
    if (denial == kDenials) platform.screen.answerAlways("com.a", AssertionAnswer::granted());
    platform.time.advance(1ns);
  }
  awaitReady(ended, "the transfer does not end");
  ended.get();
  EXPECT_EQ(platform.registry.installs().size(), 1U);
  EXPECT_EQ(platform.journal.count("homeScreen.terminationAssertionCreate"), std::size_t{kDenials + 1});
}

TEST_F(InstallQueue, AnInstallWithoutAnAssertionObjectReleasesNothing) {
  platform.screen.answerAlways("com.a", AssertionAnswer::without(0));
  performInstall(receive("com.a"));
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
  EXPECT_EQ(platform.journal.count("homeScreen.release"), 0U);
}

TEST_F(InstallQueue, NeverMoreThanTenInstallsRunAtOnceAndNoTodoUpdateIsLost) {
  constexpr std::size_t kAssets = 200;
  Strings identifiers;
  for (std::size_t number = 0; number < kAssets; ++number)
    identifiers.push_back("com.app" + std::to_string(number));
  writeTodoList(identifiers);
  for (std::size_t number = 0; number < kAssets; number += 3) {
    platform.registry.failures.failAlways(RegistryOperation::installApplication, identifiers[number],
                                          installerError("bad"));
  }
  AppsClient& client = makeClient();
  platform.registry.installGate.close();
  for (const std::string& identifier : identifiers)
    client._enqueueAssetInstall(receive(identifier));
  platform.registry.installGate.waitUntilStopped(10);
  platform.registry.installGate.open();
  client.assetTransferEndedWithSuccess(true);

  EXPECT_EQ(platform.registry.mostInstallsAtOnce(), 10U);
  for (std::size_t number = 0; number < kAssets; ++number) {
    EXPECT_EQ(operationWord(platform.files, identifiers[number]), number % 3 == 0 ? "FAILED" : "INSTALLED");
  }
}

}  // namespace
}  // namespace appsync::test
