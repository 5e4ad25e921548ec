// Installs that fail: what is marked, removed and kept.
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
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/NoMoreThreads.h"
#include "tests/transfer/InstallQueueFixture.h"

namespace appsync::test {
namespace {

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
  EXPECT_FALSE(client._isRecoverableError(Error{std::string(platform::kInstallerErrorDomain), 5, "", nullptr}));
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

}  // namespace
}  // namespace appsync::test
