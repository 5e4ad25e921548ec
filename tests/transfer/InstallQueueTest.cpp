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
#include "kit/fakes/TodoList.h"
#include "tests/ClientFixture.h"
#include "tests/NoMoreThreads.h"

namespace appsync::test {
namespace {

using namespace std::chrono_literals;
using platform::ZTAsset;
using Strings = std::vector<std::string>;

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

const Error kNoThread{"POSIX", EAGAIN, "Resource temporarily unavailable", nullptr};

/// Answers a request for an assertion with nothing.
class ForgetfulHomeScreen final : public platform::HomeScreenService {
 public:
  Port blockableServerPort() override { return 0; }
  void setIconState(Port, ByteView) override {}
  std::optional<Bytes> getFlattenedIconState(Port, std::uint32_t) override { return std::nullopt; }
  std::unique_ptr<platform::TerminationAssertion> terminationAssertionCreate(
      std::string_view, std::uint32_t, platform::TerminationAssertionOutcome&) override {
    return nullptr;
  }
};

class InstallQueue : public ClientFixture {
 protected:
  void SetUp() override { platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff"); }

  static std::string pathOf(std::string_view identifier) {
    return "/var/mobile/Media/PublicStaging/" + std::string(identifier);
  }

  template <class Asset = ZTAsset, class... Arguments>
  std::shared_ptr<ZTAsset> receive(const std::string& identifier, Arguments... arguments) {
    platform.files.put(pathOf(identifier), packageOf(identifier, "2.0"));
    std::shared_ptr<ZTAsset> asset;
    if constexpr (sizeof...(Arguments) == 0) {
      asset = std::make_shared<ZTAsset>(identifier, "Application", identifier);
    } else {
      asset = std::make_shared<Asset>(identifier, arguments...);
    }
    asset->setIsDownload(true);
    asset->setPath(pathOf(identifier));
    return asset;
  }

  std::shared_ptr<ZTAsset> receiveRestored(const std::string& identifier) {
    auto asset = receive(identifier);
    asset->setIsRestore(true);
    return asset;
  }

  void writeTodoList(const Strings& identifiers) {
    plist::Array entries;
    for (const std::string& identifier : identifiers)
      entries.emplace_back(entry(identifier, "DOWNLOADED"));
    platform.files.put(kTodoListPath, binaryForm(std::move(entries)));
  }

  void writeRestoreState(std::string_view identifier) {
    putPropertyList(platform.files, kRestoreStatePath,
                    plist::Dictionary{{identifier, plist::Dictionary{{"1", plist::Dictionary{{"path", "/p"}}}}}});
  }

  [[nodiscard]] Strings transactionsOf(std::string_view identifier) const {
    Strings lines;
    for (const ScenarioEntry& each : platform.transactions.scenarios()) {
      if (each.bundleIdentifier != identifier) continue;
      EXPECT_EQ(each.step, 0U);
      lines.push_back(each.scenario + ": " + each.description + (each.success == Success::yes ? " y" : " n"));
    }
    return lines;
  }

  /// Runs one install to its end on the calling thread.
  AppsClient& performInstall(const std::shared_ptr<ZTAsset>& asset) {
    AppsClient& client = makeClient();
    platform.log.clear();
    client._performAssetInstall(asset);
    return client;
  }
};

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
  cleaned.get_future().get();
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
  ended.get();
  EXPECT_EQ(platform.registry.installs().size(), 1U);
  EXPECT_EQ(platform.journal.count("homeScreen.terminationAssertionCreate"), std::size_t{kDenials + 1});
}

TEST_F(InstallQueue, AnUnknownAnswerFailsTheInstallWithInvalidArgument) {
  writeTodoList({"com.a"});
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.screen.answerAlways("com.a", AssertionAnswer::without(3));
  AppsClient& client = performInstall(receive("com.a"));

  EXPECT_TRUE(platform.log.contains(loggedError("Unknown error 3 getting assertion for com.a")));
  EXPECT_TRUE(platform.log.contains(logged("com.a install failed unrecoverably: POSIX 22 \"\"")))
      << testing::PrintToString(platform.log.messages());
  EXPECT_EQ(transactionsOf("com.a"),
            (Strings{"Asset install: unknown error grabbing assertion n", "Nimbra restore: placeholder removed y"}));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "FAILED");
  EXPECT_TRUE(platform.registry.installs().empty());
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 0);
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
  EXPECT_EQ(platform.time.pendingTasks(), 0U);
}

TEST_F(InstallQueue, AnInstallerFailureMarksTheAppFailedRemovesItAndItsPackage) {
  writeTodoList({"com.a"});
  writeRestoreState("com.a");
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", installerError("bad package"));
  AppsClient& client = performInstall(receive("com.a"));

  EXPECT_TRUE(platform.log.contains(
      logged("com.a install failed unrecoverably: " + description(installerError("bad package")))));
  EXPECT_TRUE(platform.log.contains(logged("Changing com.a from DOWNLOADED to FAILED")));
  EXPECT_EQ(transactionsOf("com.a"),
            (Strings{"Asset install: assertion succeeded y", "Nimbra restore: placeholder removed y"}));
  ASSERT_EQ(platform.registry.uninstalls().size(), 1U);
  EXPECT_EQ(platform.registry.uninstalls()[0], (FakeAppRegistry::Uninstall{"com.a", {}}));
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
  EXPECT_FALSE(platform.files.has(kRestoreStatePath));
  EXPECT_EQ(client._getAndResetNumAppInstallsAttempted(), 1);
}

TEST_F(InstallQueue, APlaceholderThatCannotBeRemovedIsLoggedAndRecorded) {
  writeTodoList({"com.a"});
  platform.registry.failures.failAlways(RegistryOperation::installApplication, "com.a", installerError("bad"));
  performInstall(receive("com.a"));
  EXPECT_TRUE(platform.log.contains(loggedError("Uninstall of com.a failed.")));
  EXPECT_EQ(transactionsOf("com.a").back(), "Nimbra restore: failed to remove placeholder n");
}

TEST_F(InstallQueue, ARecoverableFailureKeepsTodoEntryAndPlaceholder) {
  const Error failure{"POSIX", 28, "disk full", nullptr};
  writeTodoList({"com.a"});
  writeRestoreState("com.a");
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.framework.judgeErrorsBy([](const Error&) { return true; });
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", failure);
  performInstall(receive("com.a"));

  EXPECT_TRUE(platform.log.contains(logged("com.a install failed but was recoverable: " + description(failure))));
  EXPECT_EQ(transactionsOf("com.a"),
            (Strings{"Asset install: assertion succeeded y", "Nimbra restore: install failed recoverably n"}));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "DOWNLOADED");
  EXPECT_TRUE(platform.registry.uninstalls().empty());
  EXPECT_FALSE(platform.files.has(kRestoreStatePath));
  EXPECT_FALSE(platform.files.has(pathOf("com.a")));
}

TEST_F(InstallQueue, FailedUpdateKeepsTheInstalledApp) {
  writeTodoList({"com.a"});
  platform.registry.add(FakeApp::updating("com.a").withVersion("1.0"));
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", installerError("bad"));
  performInstall(receive("com.a"));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "FAILED");
  EXPECT_EQ(platform.registry.uninstalls(), (std::vector<FakeAppRegistry::Uninstall>{{"com.a", {}}}));
  ASSERT_TRUE(platform.registry.app("com.a"));
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
  EXPECT_FALSE(platform.registry.app("com.a")->isPlaceholder);
  EXPECT_TRUE(platform.uninstalledList.identifiers().empty());
  EXPECT_EQ(transactionsOf("com.a").back(), "Nimbra restore: placeholder removed y");
}

TEST_F(InstallQueue, AFailedRestoreIsNeverMarkedFailedAndNeverUninstalled) {
  writeTodoList({"com.a"});
  platform.registry.add(FakeApp::placeholder("com.a", platform::TSInstallType::Restore));
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", installerError("bad"));
  performInstall(receiveRestored("com.a"));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "DOWNLOADED");
  EXPECT_TRUE(platform.registry.uninstalls().empty());
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
  EXPECT_EQ(transactionsOf("com.a").back(), "Nimbra restore: install failed recoverably n");
  EXPECT_EQ(platform.journal.count("backupManager."), 0U);
}

TEST_F(InstallQueue, AnAssetThatBecameARestoreMeanwhileHasItsRestoreCancelledAsWell) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a", installerError("bad"));
  performInstall(receive<ReclassifiedAsset>("com.a", std::vector<bool>{false, true}));
  EXPECT_EQ(platform.journal.lines({"backupManager.", "registry.uninstall"}),
            (Strings{"backupManager.cancelApplicationRestore com.a", "registry.uninstallApplication com.a"}));
}

TEST_F(InstallQueue, ErrorsAreRecoverableOnlyWhenTheFrameworkSaysSoAndNoInstallerMadeThem) {
  AppsClient& client = makeClient();
  EXPECT_FALSE(client._isRecoverableError(Error{"POSIX", 5, "", nullptr}));
  EXPECT_FALSE(client._isRecoverableError(std::nullopt));
  platform.framework.judgeErrorsBy([](const Error&) { return true; });
  EXPECT_TRUE(client._isRecoverableError(Error{"POSIX", 5, "", nullptr}));
  EXPECT_FALSE(client._isRecoverableError(std::nullopt));
  EXPECT_FALSE(client._isRecoverableError(Error{"TessalyError", 5, "", nullptr}));
  EXPECT_FALSE(client._isRecoverableError(Error{std::string(platform::InstallerErrorDomain), 5, "", nullptr}));
}

TEST_F(InstallQueue, AnErrorOfTheTessalyDomainIsUnrecoverableWhateverTheFrameworkSays) {
  writeTodoList({"com.a"});
  platform.registry.add(FakeApp::placeholder("com.a"));
  platform.framework.judgeErrorsBy([](const Error&) { return true; });
  platform.registry.failures.failNext(RegistryOperation::installApplication, "com.a",
                                      Error{"TessalyError", 5, "damaged", nullptr});
  performInstall(receive("com.a"));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "FAILED");
  EXPECT_FALSE(platform.registry.app("com.a"));
}

TEST_F(InstallQueue, UnderCoordinationEveryErrorIsUnrecoverable) {
  platform.coordination.enable();
  platform.framework.judgeErrorsBy([](const Error&) { return true; });
  AppsClient& client = makeClient();
  const Error error{"POSIX", 5, "busy", nullptr};
  EXPECT_FALSE(client._isRecoverableError(error));
  EXPECT_TRUE(platform.log.contains(
      logged("Choreon is enabled - treating error " + description(error) + " as non recoverable")));
  EXPECT_EQ(platform.journal.count("syncFramework.ZTIsRecoverableError"), 0U);
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
