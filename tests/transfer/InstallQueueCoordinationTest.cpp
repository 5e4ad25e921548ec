// Install failures on a device that installs through coordinators.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using Strings = std::vector<std::string>;

class InstallQueueCoordination : public ClientFixture {
 protected:
  void SetUp() override {
    platform.coordination.enable();
    platform.files.put(kTodoListPath, binaryForm(plist::Array{entry("com.a", "DOWNLOADED")}));
    platform.registry.add(FakeApp::placeholder("com.a"));
  }

  /// The outcome of an install that an error of a kind that may pass has ended.
  void fail(std::vector<bool> isRestore) {
    platform.framework.judgeErrorsBy([](const Error&) { return true; });
    AppsClient& client = makeClient();
    platform.log.clear();
    client.assetInstallFailed(ReclassifiedAsset("com.a", std::move(isRestore)), {"POSIX", 5, "busy", nullptr});
    platform.coordination.waitUntilIdle();
  }

  [[nodiscard]] bool said(std::string_view message) const { return platform.log.contains(logged(message)); }
};

TEST_F(InstallQueueCoordination, AFailedInstallIsMarkedFailedAndUninstalledThroughTheService) {
  fail({false});
  EXPECT_EQ(operationWord(platform.files, "com.a"), "FAILED");
  EXPECT_EQ(platform.journal.lines({"installCoordination.", "registry.uninstall", "backupManager."}),
            Strings{"installCoordination.uninstallApp com.a"});
  EXPECT_FALSE(platform.registry.app("com.a"));
  EXPECT_TRUE(platform.transactions.scenarios().empty());
}

TEST_F(InstallQueueCoordination, AFailedRestoreIsNeitherMarkedNorUninstalled) {
  fail({true});
  EXPECT_EQ(operationWord(platform.files, "com.a"), "DOWNLOADED");
  EXPECT_EQ(platform.journal.count("installCoordination."), 0U);
  EXPECT_EQ(platform.transactions.scenarios(),
            (std::vector{ScenarioEntry{"Nimbra restore", Success::no, "com.a", "install failed recoverably"}}));
}

TEST_F(InstallQueueCoordination, AnAssetThatBecomesARestoreMeanwhileIsLeftToTheService) {
  fail({false, true});
  EXPECT_TRUE(said("not asking backup manager to cancel app restore for com.a as install coordination is enabled"));
  EXPECT_TRUE(said("not uninstalling restore asset com.a as install coordination is enabled"));
  EXPECT_EQ(platform.journal.lines({"installCoordination.", "registry.uninstall", "backupManager."}), Strings{});
  EXPECT_TRUE(platform.transactions.scenarios().empty());
}

TEST_F(InstallQueueCoordination, TheRestoreStateIsCleanedInEveryCase) {
  constexpr std::string_view kRestoreState = "/var/mobile/Library/ApplicationSync/RestoreState.plist";
  for (const std::vector<bool>& answers : {std::vector{false}, std::vector{true}, std::vector{false, true}}) {
    putPropertyList(platform.files, kRestoreState, plist::Dictionary{{"com.a", plist::Dictionary{}}});
    fail(answers);
    EXPECT_FALSE(platform.files.has(kRestoreState));
  }
}

}  // namespace
}  // namespace appsync::test
