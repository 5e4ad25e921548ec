// What becomes of a package while the host sends it and once it has come, or failed to.
#include <algorithm>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;
using platform::ZTAsset;
using Strings = std::vector<std::string>;

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";
constexpr std::string_view kPackage = "/var/mobile/Media/PublicStaging/com.a.zip";

class TransferCompletion : public ClientFixture {
 protected:
  void SetUp() override {
    platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff");
    platform.files.put(kTodoListPath, binaryForm(plist::Array{entry("com.a", "install")}));
    platform.files.put(kPackage, packageOf("com.a", "2.0"));
    asset_->setIsDownload(true);
    asset_->setPath("com.a.zip");
    asset_->setVariantOptions({{"Version", "2.0"}, {"AssetParts", 1}});
  }

  /// The placeholder that waits for the package.
  std::shared_ptr<FakeInstallProgress> addPlaceholder(TSInstallType type = TSInstallType::Sync) {
    platform.registry.add(FakeApp::placeholder("com.a", type));
    return platform.registry.app("com.a")->progress;
  }

  void makeRestore(std::uint32_t completedParts) {
    asset_->setIsRestore(true);
    asset_->setCompletedAssetParts(completedParts);
  }

  AppsClient& succeed() {
    AppsClient& client = makeClient();
    platform.log.clear();
    client.assetTransferSucceeded(asset_, true, std::nullopt);
    client.assetTransferEndedWithSuccess(true);
    return client;
  }

  AppsClient& fail(const Error& error) {
    AppsClient& client = makeClient();
    platform.log.clear();
    client.assetTransferSucceeded(asset_, false, error);
    return client;
  }

  [[nodiscard]] bool isInstalled() const {
    const auto app = platform.registry.app("com.a");
    return app && app->isInstalled;
  }

  [[nodiscard]] std::optional<std::string> installedFrom() const {
    const auto installs = platform.registry.installs();
    return installs.empty() ? std::nullopt : std::optional(installs.back().location.path);
  }

  const std::shared_ptr<ZTAsset> asset_ = std::make_shared<ZTAsset>("com.a", "Application", "A");
  const Error error_{"ZTError", 7, "lost the host", nullptr};
};

TEST_F(TransferCompletion, ProgressIsShownInThousandthsTruncated) {
  const auto progress = addPlaceholder();
  AppsClient& client = makeClient();
  client.assetTransferUpdatedProgress(asset_, 0.4567);
  EXPECT_EQ(progress->calls(), (Strings{"setInstallState 1", "setTotalUnitCount 1000", "setCompletedUnitCount 456"}));
  EXPECT_TRUE(platform.log.contains(logged("finished transferring 0.456700 for com.a")));
  EXPECT_TRUE(platform.log.contains(loggedError("Returning progress of com.a progress for com.a")));
}

TEST_F(TransferCompletion, TheTotalIsSetOnlyWhenItDiffers) {
  const auto progress = addPlaceholder();
  progress->setTotalUnitCount(1000);
  AppsClient& client = makeClient();
  client.assetTransferUpdatedProgress(asset_, 1.0);
  EXPECT_EQ(progress->calls(), (Strings{"setTotalUnitCount 1000", "setInstallState 1", "setCompletedUnitCount 1000"}));
}

TEST_F(TransferCompletion, ProgressThatIsNoFractionIsHarmless) {
  const auto progress = addPlaceholder();
  AppsClient& client = makeClient();
  client.assetTransferUpdatedProgress(asset_, std::numeric_limits<double>::quiet_NaN());
  EXPECT_EQ(progress->completedUnitCount(), 0);
  client.assetTransferUpdatedProgress(asset_, std::numeric_limits<double>::infinity());
  EXPECT_EQ(progress->completedUnitCount(), std::numeric_limits<std::int32_t>::max());
  client.assetTransferUpdatedProgress(asset_, -1e300);
  EXPECT_EQ(progress->completedUnitCount(), -std::int64_t{std::numeric_limits<std::int32_t>::max()});
}

TEST_F(TransferCompletion, ProgressOfAnAppWithoutARecordIsOnlyLogged) {
  makeClient().assetTransferUpdatedProgress(asset_, 0.5);
  EXPECT_TRUE(platform.log.contains(loggedError("Returning (null) progress for com.a")));
  EXPECT_EQ(platform.journal.count("progress."), 0U);
}

TEST_F(TransferCompletion, UnderCoordinationThereIsNoProgressObject) {
  addPlaceholder();
  platform.coordination.enable();
  EXPECT_EQ(makeClient()._progressForAssetIdentifier("com.a"), nullptr);
  EXPECT_TRUE(platform.log.contains(
      logged("Not returning a progress object for com.a because install coordination is enabled")));
}

TEST_F(TransferCompletion, AReportedAssetIsOutstandingUntilItsTransferEnds) {
  const auto progress = addPlaceholder();
  AppsClient& client = makeClient();
  client.assetTransferUpdatedProgress(asset_, 0.1);
  client.assetTransferUpdatedProgress(asset_, 0.2);
  client.assetTransferEndedWithSuccess(false);
  EXPECT_EQ(progress->installState(), TSInstallState::Failed);

  client.assetTransferUpdatedProgress(asset_, 0.3);
  client.assetTransferSucceeded(asset_, false, error_);
  platform.log.clear();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(platform.log.messages(),
            (Strings{"asset transfer ended withsuccess: y", "Notifying SV we are done syncing"}));
}

TEST_F(TransferCompletion, AReceivedPackageIsMarkedDownloadedAndInstalled) {
  const auto progress = addPlaceholder();
  AppsClient& client = makeClient();
  platform.registry.installGate.close();
  client.assetTransferSucceeded(asset_, true, std::nullopt);
  EXPECT_EQ(operationWord(platform.files, "com.a"), "DOWNLOADED");
  EXPECT_EQ(platform.journal.lines({"registry.installPhaseFinished"}),
            Strings{"registry.installPhaseFinishedForProgress com.a"});
  EXPECT_TRUE(sameLines(
      {logged("transfer for asset com.a ended with success y error (null) existingApp:0"),
       loggedError("Returning progress of com.a progress for com.a"),
       logged("asset transfer succeeded for Application/com.a"), logged("Received file at " + std::string(kPackage)),
       logged("Changing com.a from install to DOWNLOADED"), logged("Installing synced asset com.a"),
       logged("Enqueue install request for com.a")},
      [&] {
        LogLines lines = platform.log.lines();
        lines.erase(std::remove_if(lines.begin(), lines.end(),
                                   [](const LogLine& line) {
                                     return line.text.find("erforming install") != std::string::npos ||
                                            line.text.find("ssertion") != std::string::npos;
                                   }),
                    lines.end());
        return lines;
      }()));
  platform.registry.installGate.open();
  client.assetTransferEndedWithSuccess(true);
  EXPECT_EQ(operationWord(platform.files, "com.a"), "INSTALLED");
}

TEST_F(TransferCompletion, ARelativePathIsPrefixedWithTheStagingFolder) {
  succeed();
  EXPECT_EQ(installedFrom(), kPackage);
}

TEST_F(TransferCompletion, AnAbsolutePathIsKept) {
  platform.files.put("/elsewhere/p.zip", packageOf("com.a", "2.0"));
  asset_->setPath("/elsewhere/p.zip");
  succeed();
  EXPECT_EQ(installedFrom(), "/elsewhere/p.zip");
}

TEST_F(TransferCompletion, APathFromTheRestoreStateIsNeverPrefixed) {
  putPropertyList(platform.files, kRestoreStatePath,
                  plist::Dictionary{{"com.a", plist::Dictionary{{"2.0", plist::Dictionary{{"path", "saved.zip"}}}}}});
  asset_->setPath(std::nullopt);
  succeed();
  EXPECT_TRUE(platform.log.contains(logged("Received file at saved.zip")));
}

TEST_F(TransferCompletion, APathThatLeadsUpwardsIsRejectedAfterThePrefix) {
  asset_->setPath("../../etc/passwd");
  succeed();
  EXPECT_TRUE(platform.log.contains(logged("Ignoring invalid path: /var/mobile/Media/PublicStaging/../../etc/passwd")));
  EXPECT_EQ(installedFrom(), std::nullopt);
  EXPECT_EQ(operationWord(platform.files, "com.a"), "install");
}

TEST_F(TransferCompletion, AMissingPathThatNobodySavedIsRejected) {
  asset_->setPath(std::nullopt);
  succeed();
  EXPECT_TRUE(platform.log.contains(logged("Ignoring invalid path: (null)")));
  EXPECT_EQ(installedFrom(), std::nullopt);
}

TEST_F(TransferCompletion, ThePathIsTheAssetsOwnBeforeItIsJudged) {
  asset_->setPath("../../etc/passwd");
  succeed();
  EXPECT_EQ(asset_->path(), "/var/mobile/Media/PublicStaging/../../etc/passwd");
}

TEST_F(TransferCompletion, AnEmptyPathIsNoneSoThatTheStagingFolderIsNeverTakenForAPackage) {
  asset_->setPath("");
  succeed();
  EXPECT_TRUE(platform.log.contains(logged("Ignoring invalid path: (null)")));
  EXPECT_TRUE(platform.files.has(kPackage));
}

TEST_F(TransferCompletion, StagingFolderItselfIsNoPackage) {
  for (const std::string path : {".", "./", "./.", "/var/mobile/Media/PublicStaging",
                                 "/var/mobile/Media/PublicStaging/", "/var/mobile//Media/./PublicStaging/."}) {
    asset_->setPath(path);
    succeed();
    EXPECT_TRUE(platform.log.contains(logged("Ignoring invalid path: " + *asset_->path()))) << path;
    EXPECT_TRUE(platform.registry.installs().empty()) << path;
    EXPECT_TRUE(platform.files.has(kPackage)) << path;
  }
  EXPECT_EQ(operationWord(platform.files, "com.a"), "install");
}

TEST_F(TransferCompletion, ASavedPathThatIsNoStringIsRejected) {
  putPropertyList(platform.files, kRestoreStatePath,
                  plist::Dictionary{{"com.a", plist::Dictionary{{"2.0", plist::Dictionary{{"path", 7}}}}}});
  asset_->setPath(std::nullopt);
  succeed();
  EXPECT_TRUE(platform.log.contains(logged("Ignoring invalid path: 7")));
}

TEST_F(TransferCompletion, AnAssetThatIsNoDownloadIsMarkedSentAndNotInstalled) {
  asset_->setIsDownload(false);
  succeed();
  EXPECT_EQ(operationWord(platform.files, "com.a"), "SENT");
  EXPECT_EQ(installedFrom(), std::nullopt);
  EXPECT_FALSE(platform.log.contains(logged("Received file at " + std::string(kPackage))));
}

TEST_F(TransferCompletion, ARestoreWithoutRestoreDataIsInstalled) {
  addPlaceholder(TSInstallType::Restore);
  makeRestore(platform::kZTAssetPartApplication);
  succeed();
  EXPECT_TRUE(platform.log.contains(logged("No restore data exists for com.a")));
  EXPECT_TRUE(isInstalled());
}

TEST_F(TransferCompletion, ARestoreWhoseDataIsStillToComeIsParkedAndItsDataInstallsIt) {
  const auto progress = addPlaceholder(TSInstallType::Restore);
  platform.backups.addRestoreData("com.a");
  makeRestore(platform::kZTAssetPartApplication);
  succeed();
  EXPECT_TRUE(platform.log.contains(logged("Restore data exists for com.a")));
  EXPECT_FALSE(isInstalled());
  EXPECT_EQ(progress->installPhase(), TSInstallPhase::RestoringData);
  EXPECT_EQ(
      propertyListAt(platform.files, kRestoreStatePath),
      plist::Value(plist::Dictionary{{"com.a", plist::Dictionary{{"2.0", plist::Dictionary{{"path", kPackage}}}}}}));

  makeRestore(platform::kZTAssetPartApplicationData);
  asset_->setPath(std::nullopt);
  succeed();
  EXPECT_EQ(installedFrom(), kPackage);
  EXPECT_TRUE(isInstalled());
  EXPECT_FALSE(platform.files.has(kRestoreStatePath));
}

TEST_F(TransferCompletion, ARestoreWithoutAPlaceholderIsParkedAllTheSame) {
  platform.backups.addRestoreData("com.a");
  makeRestore(platform::kZTAssetPartApplication);
  succeed();
  EXPECT_TRUE(platform.files.has(kRestoreStatePath));
  EXPECT_FALSE(isInstalled());
}

TEST_F(TransferCompletion, ARecoverableFailureOnlyMarksTheProgressFailed) {
  const auto progress = addPlaceholder();
  platform.framework.judgeErrorsBy([](const Error&) { return true; });
  fail(error_);
  EXPECT_TRUE(sameLines(
      {logged("transfer for asset com.a ended with success n error " + description(error_) + " existingApp:0"),
       loggedError("Returning progress of com.a progress for com.a"),
       logged("failed to transfer asset Application/com.a. err=" + description(error_) + ", recoverable=1")},
      platform.log.lines()));
  EXPECT_EQ(progress->calls(), Strings{"setInstallState 4"});
  EXPECT_TRUE(platform.registry.uninstalls().empty());
  EXPECT_EQ(operationWord(platform.files, "com.a"), "install");
}

TEST_F(TransferCompletion, AnUnrecoverableFailureRemovesThePlaceholderOnly) {
  const auto progress = addPlaceholder();
  fail(error_);
  EXPECT_EQ(progress->installState(), TSInstallState::Canceled);
  EXPECT_EQ(platform.registry.uninstalls(),
            (std::vector{FakeAppRegistry::Uninstall{"com.a", {{"UninstallPlaceholdersOnly", true}}}}));
  EXPECT_TRUE(platform.log.contains(logged("Uninstalling placeholder com.a")));
  EXPECT_TRUE(platform.log.contains(logged("Uninstalling app using TS com.a secceeded")));
}

TEST_F(TransferCompletion, AnUnrecoverableFailureLeavesAnInstalledAppUnderThePlaceholder) {
  platform.registry.add(FakeApp::updating("com.a"));
  fail(error_);
  EXPECT_TRUE(isInstalled());
  EXPECT_FALSE(platform.registry.app("com.a")->isPlaceholder);
}

TEST_F(TransferCompletion, AFailedRemovalOfThePlaceholderIsLogged) {
  addPlaceholder();
  platform.registry.failures.failNext(RegistryOperation::uninstallApplication, "com.a", installerError("no"));
  fail(error_);
  EXPECT_TRUE(platform.log.contains(logged("Uninstalling app using TS com.a failed")));
}

TEST_F(TransferCompletion, AnUnrecoverableFailureOfAnUnknownAppIsOnlyLogged) {
  fail(error_);
  EXPECT_EQ(platform.log.messages().back(),
            "failed to transfer asset Application/com.a. err=" + description(error_) + ", recoverable=0");
  EXPECT_TRUE(platform.registry.uninstalls().empty());
}

TEST_F(TransferCompletion, AnUnrecoverableFailureNeverRemovesARestore) {
  const auto progress = addPlaceholder(TSInstallType::Restore);
  makeRestore(0);
  fail(error_);
  EXPECT_TRUE(platform.registry.uninstalls().empty());
  EXPECT_TRUE(progress->calls().empty());
}

TEST_F(TransferCompletion, AnAssetThatBecameARestoreMeanwhileHasItsRestoreCancelled) {
  addPlaceholder();
  AppsClient& client = makeClient();
  client.assetTransferSucceeded(std::make_shared<ReclassifiedAsset>("com.a", std::vector<bool>{false, true}), false,
                                error_);
  EXPECT_EQ(platform.journal.lines({"backupManager.", "registry.uninstall"}),
            (Strings{"backupManager.cancelApplicationRestore com.a",
                     "registry.uninstallApplication com.a placeholder only"}));
}

TEST_F(TransferCompletion, ProgressThatIsCancelledAlreadyIsNotCancelledAgain) {
  const auto progress = addPlaceholder();
  progress->setInstallState(TSInstallState::Failed);
  fail(error_);
  EXPECT_EQ(progress->calls(), Strings{"setInstallState 4"});
}

TEST_F(TransferCompletion, TransfersOfSeveralAssetsAreReportedSideBySide) {
  constexpr std::size_t kAssets = 16;
  plist::Array entries;
  std::vector<std::shared_ptr<ZTAsset>> assets;
  for (std::size_t number = 0; number < kAssets; ++number) {
    const std::string identifier = "com.app" + std::to_string(number);
    entries.emplace_back(entry(identifier, "install"));
    platform.registry.add(FakeApp::placeholder(identifier));
    platform.files.put("/var/mobile/Media/PublicStaging/" + identifier, packageOf(identifier, "2.0"));
    assets.push_back(std::make_shared<ZTAsset>(identifier, "Application", identifier));
    assets.back()->setIsDownload(true);
    assets.back()->setPath(identifier);
  }
  platform.files.put(kTodoListPath, binaryForm(std::move(entries)));
  AppsClient& client = makeClient();
  const auto transfer = [&](std::size_t number) {
    for (const double fraction : {0.25, 0.5, 1.0})
      client.assetTransferUpdatedProgress(assets[number], fraction);
    const bool succeeds = number % 4 != 0;
    client.assetTransferSucceeded(assets[number], succeeds, succeeds ? std::nullopt : std::optional(error_));
  };
  std::vector<std::thread> threads;
  for (std::size_t number = 0; number < kAssets; ++number)
    threads.emplace_back(transfer, number);
  for (std::thread& thread : threads)
    thread.join();
  client.assetTransferEndedWithSuccess(true);

  for (std::size_t number = 0; number < kAssets; ++number) {
    const std::string& identifier = assets[number]->identifier();
    EXPECT_EQ(operationWord(platform.files, identifier), number % 4 == 0 ? "install" : "INSTALLED");
    EXPECT_EQ(platform.registry.app(identifier).has_value(), number % 4 != 0);
  }
  EXPECT_FALSE(platform.log.contains(loggedError("Called with success == YES but with 1 outstanding DCX transfers!")));
}

TEST_F(TransferCompletion, AFailureWithoutAnErrorIsUnrecoverable) {
  addPlaceholder();
  makeClient().assetTransferSucceeded(asset_, false, std::nullopt);
  EXPECT_TRUE(platform.log.contains(logged("failed to transfer asset Application/com.a. err=(null), recoverable=0")));
}

}  // namespace
}  // namespace appsync::test
