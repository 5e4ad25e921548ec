#include "tests/faults/DaemonSync.h"

#include <chrono>
#include <thread>

#include <gtest/gtest.h>

#include "platform/SyncFiles.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

using platform::ZTAsset;

/// More attempts than a single failure can cause.
constexpr int kMostAttempts = 10;

}  // namespace

void setMode(FakePlatform& platform, Mode mode) {
  if (mode == Mode::direct) return;
  platform.coordination.enable();
  platform.coordination.installAutomatically();
  platform.coordination.gate.close();
}

void DaemonSync::run(const std::function<void()>& meanwhile) {
  platform_.bundleFolders.setMainBundleIdentifier(std::string(kDaemonBundleIdentifier));
  client_ = AppsClient::create(platform_);
  platform_.notify.deliver(platform::kZTStartupCompleteNotification);
  client_->prepareForSyncWithHostAnchor(client_->currentSyncAnchor(), {}, nullptr);
  static_cast<void>(client_->installedAssets());
  std::optional<Error> error;
  if (client_->reconcileSync({}, "anchor", {}, &error)) {
    waitForInstalls();
    transferAssets(meanwhile);
    client_->assetTransferEndedWithSuccess(true);
    waitForInstalls();
    client_->syncEndedWithSuccess(true);
  } else {
    EXPECT_TRUE(error) << "a refused sync must set an error";
    client_->syncEndedWithSuccess(false);
  }
  EXPECT_EQ(client_.use_count(), 1) << "the plug-in still has work after the sync";
  client_.reset();
}

void DaemonSync::transferAssets(const std::function<void()>& meanwhile) {
  const auto outstanding = client_->outstandingAssetTransfers();
  waitForInstalls();
  for (const Asset& asset : outstanding)
    transfer(asset);
  meanwhile();
  waitForInstalls();
}

void DaemonSync::transfer(const Asset& asset) {
  const plist::Value* parts = asset->variantOptions().find(platform::kAssetPartsKey);
  ASSERT_NE(parts, nullptr);
  client_->assetTransferUpdatedProgress(asset, 0.5);
  if (const auto failure = host_.failureOf(asset->identifier())) {
    client_->assetTransferSucceeded(asset, false, failure);
    waitForInstalls();
    return;
  }
  client_->assetTransferUpdatedProgress(asset, 1.0);
  if (*parts != plist::Value(platform::kZTAssetPartApplicationData)) send(asset);
  if (asset->isRestore() && platform_.backups.hasRestoreData(asset->identifier())) sendData(asset);
}

void DaemonSync::send(const Asset& asset) {
  const std::string name = asset->identifier() + ".zip";
  platform_.files.put(std::string(kPublicStaging) + "/" + name, host_.packageOf(asset->identifier()));
  asset->setPath(name);
  asset->setCompletedAssetParts(platform::kZTAssetPartApplication);
  client_->assetTransferSucceeded(asset, true, std::nullopt);
  waitForInstalls();
}

/// The data part is a separate transfer: after the end of a transfer, only the plug-in may change its asset.
void DaemonSync::sendData(const Asset& asset) {
  const auto data = std::make_shared<ZTAsset>(asset->identifier(), asset->dataclass(), asset->prettyName());
  data->setIsDownload(true);
  data->setIsRestore(true);
  data->setVariantOptions(asset->variantOptions());
  data->setCompletedAssetParts(platform::kZTAssetPartApplicationData);
  client_->assetTransferSucceeded(data, true, std::nullopt);
  waitForInstalls();
}

/// The service's thread is stopped while the daemon calls the client, so that the order of all calls is fixed.
void DaemonSync::waitForInstalls() {
  if (mode_ == Mode::coordinated) {
    platform_.coordination.runUntilIdle();
  } else {
    waitForDirectInstalls();
  }
}

/// Running and postponed installs share ownership of the client until their last call has returned.
void DaemonSync::waitForDirectInstalls() {
  for (int attempt = 0; attempt < kMostAttempts; ++attempt) {
    while (true) {
      const std::size_t waiting = platform_.time.pendingTasks();
      if (client_.use_count() == static_cast<long>(1 + waiting)) break;
      std::this_thread::yield();
    }
    if (platform_.time.pendingTasks() == 0) return;
    platform_.time.advance(std::chrono::seconds(30));
  }
  ADD_FAILURE() << "an install is retried indefinitely";
}

}  // namespace appsync::test
