// The progress and the end of a package's transfer from the host.
#include <algorithm>
#include <cmath>
#include <filesystem>
#include <limits>
#include <string_view>
#include <utility>

#include "common/RestoreState.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

/// A transfer that has ended, and the state of its app.
struct EndedTransfer {
  const std::shared_ptr<platform::ZTAsset>& asset;
  const std::optional<Error>& error;
  bool isExistingApp = false;
  bool isUserCancelled = false;
  std::shared_ptr<platform::InstallProgress> progress = nullptr;
};

namespace {

using platform::InstallProgress;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::ZTAsset;

/// A transfer's progress is always shown out of this many units.
constexpr std::int64_t kTransferUnits = 1000;

/// Clamps: a fraction from the daemon may be NaN or out of the range of integers.
std::int64_t completedUnits(double fraction) {
  const double units = fraction * static_cast<double>(kTransferUnits);
  const auto largest = static_cast<double>(std::numeric_limits<std::int32_t>::max());
  return std::isnan(units) ? 0 : static_cast<std::int64_t>(std::clamp(units, -largest, largest));
}

/// Whether `path` is the staging folder itself: as a package, it would be removed with all packages in it.
bool isStagingFolder(std::string_view path) {
  using Path = std::filesystem::path;
  return (Path(path) / "").lexically_normal() == Path(kPublicStaging) / "";
}

void showTransfer(InstallProgress& progress, double fraction) {
  progress.setInstallState(TSInstallState::Active);
  if (progress.totalUnitCount() != kTransferUnits) progress.setTotalUnitCount(kTransferUnits);
  progress.setCompletedUnitCount(completedUnits(fraction));
}

/// Returns the absolute path of the asset's package, or nullopt if the asset has no path.
std::optional<plist::Value> absolutePath(const ZTAsset& asset) {
  const std::string path = asset.path().value_or("");
  if (path.empty()) return std::nullopt;
  return path.starts_with('/') ? path : std::string(kPublicStaging) + "/" + path;
}

/// Does nothing but log if installs are coordinated.
void cancelRestore(platform::BackupManager& backups, const std::string& identifier, bool useInstallCoordinator,
                   const PlugInLog& log) {
  if (useInstallCoordinator) {
    log.message("%s|Install coordination is enabled - not calling cancelApplicationRestoreWithBundleID for %{public}@",
                identifier);
  } else {
    backups.cancelApplicationRestore(identifier, nullptr);
  }
}

}  // namespace

std::shared_ptr<InstallProgress> AppsClient::_progressForAssetIdentifier(std::string_view identifier) {
  if (_useInstallCoordinator) {
    _log.message("%s|Not returning a progress object for %{public}@ because install coordination is enabled",
                 identifier);
    return nullptr;
  }
  platform::AppRegistry& registry = _platform.defaultRegistry();
  const auto record = registry.recordForIdentifier(identifier, platform::PlaceholderLookup::on);
  auto progress = record ? registry.installProgressForApplication(*record, TSInstallPhase::Loading) : nullptr;
  _log.error("%s|Returning %{public}@ progress for %{public}@", progress, identifier);
  return progress;
}

void AppsClient::assetTransferUpdatedProgress(const std::shared_ptr<ZTAsset>& asset, double fraction) {
  const std::string& identifier = asset->identifier();
  _log.message("%s|finished transferring %lf for %{public}@", fraction, identifier);
  if (_useInstallCoordinator) {
    const bool isExistingApp = _accessQueue.sync([&] { return _updatingApps.contains(identifier); });
    updateTransferProgressForApp(*asset, isExistingApp);
  } else if (const auto progress = _progressForAssetIdentifier(identifier)) {
    showTransfer(*progress, fraction);
  }
  const std::lock_guard lock(_outstandingMutex);
  _outstandingDCXTransfers.insert(identifier);
}

void AppsClient::assetTransferSucceeded(const std::shared_ptr<ZTAsset>& asset, bool succeeded,
                                        const std::optional<Error>& error) {
  const std::string& identifier = asset->identifier();
  EndedTransfer transfer{asset, error};
  _accessQueue.sync([&] {
    transfer.isExistingApp = _updatingApps.erase(identifier) > 0;
    transfer.isUserCancelled = _userCancelledApps.erase(identifier) > 0;
  });
  {
    const std::lock_guard lock(_outstandingMutex);
    _outstandingDCXTransfers.erase(identifier);
  }
  _log.message("%s|transfer for asset %{public}@ ended with success %c error %{public}@ existingApp:%d", identifier,
               succeeded, error, transfer.isExistingApp);
  transfer.progress = _progressForAssetIdentifier(identifier);
  if (succeeded) {
    _handleReceivedAsset(transfer);
  } else {
    _handleFailedTransfer(transfer);
  }
}

void AppsClient::_handleReceivedAsset(const EndedTransfer& transfer) {
  const auto& asset = transfer.asset;
  const std::string& identifier = asset->identifier();
  _log.message("%s|asset transfer succeeded for %{public}@", asset->shortDescription());
  if (transfer.progress && _useInstallCoordinator) {
    _log.message("%s|not setting install phase finished for %{public}@ as coordination is enabled", identifier);
  } else if (transfer.progress) {
    _platform.defaultRegistry().installPhaseFinishedForProgress(*transfer.progress);
  }

  auto received = absolutePath(*asset);
  if (!received) {  // The package may be on the device since an earlier transfer.
    received = _accessQueue.sync(
        [&] { return _restoreStatePropertyForKey(kRestoreStatePathKey, identifier, asset->version()); });
  }
  const plist::Value* path = received ? &*received : nullptr;
  if (auto text = ownedStringIn(path)) asset->setPath(std::move(text));
  if (!isValidBundleIdentifier(path) || isStagingFolder(*path->string())) {
    _log.message("%s|Ignoring invalid path: %{public}@", path);
    return;
  }
  if (!asset->isDownload()) {
    _accessQueue.sync([&] { changeAssetID(identifier, todo::kSent); });
    return;
  }
  _log.message("%s|Received file at %{public}@", asset->path());
  _accessQueue.sync([&] { changeAssetID(identifier, todo::kDownloaded); });
  if (asset->isRestore()) {
    _handleReceivedRestoreAsset(transfer);
  } else {
    _log.message("%s|Installing synced asset %{public}@", identifier);
    if (_useInstallCoordinator) {
      transferCompleteForApp(*asset, std::nullopt, transfer.isExistingApp);
    } else {
      _enqueueAssetInstall(asset);
    }
  }
}

void AppsClient::_handleReceivedRestoreAsset(const EndedTransfer& transfer) {
  const auto& asset = transfer.asset;
  const std::string& identifier = asset->identifier();
  const bool hasDataOnly = asset->completedAssetParts() == platform::kZTAssetPartApplicationData;
  if (_useInstallCoordinator) {
    if (hasDataOnly) {
      _log.message(
          "%s|Not processing kZTAssetPartApplicationData for restore asset %{public}@ as coordination is enabled",
          identifier);
    } else {
      _log.message("%s|Not processing restore asset %{public}@ as coordination is enabled", identifier);
    }
    return;
  }
  if (hasDataOnly) {
    _enqueueAssetInstall(asset);  // The package has waited for its data; it lies where the restore state says.
    return;
  }
  if (!_backupManager->restoreDataExists(identifier, nullptr)) {
    _log.message("%s|No restore data exists for %{public}@", identifier);
    _enqueueAssetInstall(asset);
    return;
  }
  _log.message("%s|Restore data exists for %{public}@", identifier);
  if (transfer.progress) transfer.progress->setInstallPhase(TSInstallPhase::RestoringData);
  _accessQueue.sync(
      [&] { _setRestoreStatePropertyValue(*asset->path(), kRestoreStatePathKey, identifier, asset->version()); });
}

void AppsClient::_handleFailedTransfer(const EndedTransfer& transfer) {
  const ZTAsset& asset = *transfer.asset;
  const auto& error = transfer.error;
  const auto& progress = transfer.progress;
  const std::string& identifier = asset.identifier();
  const bool isRecoverable = _isRecoverableError(error);
  _log.message("%s|failed to transfer asset %{public}@. err=%{public}@, recoverable=%d", asset.shortDescription(),
               error, isRecoverable);
  if (isRecoverable) {
    if (progress) progress->setInstallState(TSInstallState::Failed);
    return;
  }
  platform::AppRegistry& registry = _platform.defaultRegistry();
  if (!registry.applicationIsInstalled(identifier) || asset.isRestore()) return;

  if (progress && progress->installState() < TSInstallState::Canceled) progress->cancel();
  _log.message("%s|Uninstalling placeholder %{public}@", identifier);
  // Asked again: the daemon may have made it a restore since.
  if (asset.isRestore()) cancelRestore(*_backupManager, identifier, _useInstallCoordinator, _log);
  if (_useInstallCoordinator) {
    // A coordinator that the user has cancelled is gone.
    if (!transfer.isUserCancelled) transferCompleteForApp(asset, error, transfer.isExistingApp);
    return;
  }
  const Status uninstalled =
      registry.uninstallApplication(identifier, {{platform::kUninstallPlaceholdersOnlyKey, true}});
  _log.message("%s|Uninstalling app using TS %{public}@ %s", identifier, uninstalled ? "secceeded" : "failed");
}

}  // namespace appsync
