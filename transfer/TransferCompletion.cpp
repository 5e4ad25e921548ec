// What becomes of a package while the host sends it and once it has come, or failed to.
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

namespace {

using platform::InstallProgress;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::ZTAsset;

/// A transfer's progress is always shown out of this many units.
constexpr std::int64_t kTransferUnits = 1000;

/// Whatever a daemon calls a fraction: a number that no integer holds must not reach the cast.
std::int64_t completedUnits(double fraction) {
  const double units = fraction * static_cast<double>(kTransferUnits);
  const auto largest = static_cast<double>(std::numeric_limits<std::int32_t>::max());
  return std::isnan(units) ? 0 : static_cast<std::int64_t>(std::clamp(units, -largest, largest));
}

/// The staging folder is no package: the end of an install would remove it with all packages in it.
bool isStagingFolder(std::string_view path) {
  using Path = std::filesystem::path;
  return (Path(path) / "").lexically_normal() == Path(kPublicStaging) / "";
}

void showTransfer(InstallProgress& progress, double fraction) {
  progress.setInstallState(TSInstallState::Active);
  if (progress.totalUnitCount() != kTransferUnits) progress.setTotalUnitCount(kTransferUnits);
  progress.setCompletedUnitCount(completedUnits(fraction));
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
  _outstandingDCXTransfers.insert(identifier);
}

void AppsClient::assetTransferSucceeded(const std::shared_ptr<ZTAsset>& asset, bool succeeded,
                                        const std::optional<Error>& error) {
  const std::string& identifier = asset->identifier();
  const TransferMarks marks = _accessQueue.sync([&] {
    return TransferMarks{.isExistingApp = _updatingApps.erase(identifier) > 0,
                         .isUserCancelled = _userCancelledApps.erase(identifier) > 0};
  });
  _outstandingDCXTransfers.erase(identifier);
  _log.message("%s|transfer for asset %{public}@ ended with success %c error %{public}@ existingApp:%d", identifier,
               succeeded, error, marks.isExistingApp);
  const auto progress = _progressForAssetIdentifier(identifier);
  if (succeeded) {
    _handleReceivedAsset(asset, marks, progress.get());
  } else {
    _handleFailedTransfer(*asset, error, marks, progress.get());
  }
}

void AppsClient::_handleReceivedAsset(const std::shared_ptr<ZTAsset>& asset, TransferMarks marks,
                                      InstallProgress* progress) {
  const std::string& identifier = asset->identifier();
  _log.message("%s|asset transfer succeeded for %{public}@", asset->shortDescription());
  if (progress != nullptr && _useInstallCoordinator) {
    _log.message("%s|not setting install phase finished for %{public}@ as coordination is enabled", identifier);
  } else if (progress != nullptr) {
    _platform.defaultRegistry().installPhaseFinishedForProgress(*progress);
  }

  const auto received = _receivedPath(*asset);
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
    _handleReceivedRestoreAsset(asset, progress);
  } else {
    _log.message("%s|Installing synced asset %{public}@", identifier);
    if (_useInstallCoordinator) {
      transferCompleteForApp(*asset, std::nullopt, marks.isExistingApp);
    } else {
      _enqueueAssetInstall(asset);
    }
  }
}

/// Where the package lies: the asset's own path made absolute, or the one that an earlier transfer of it left.
std::optional<plist::Value> AppsClient::_receivedPath(const ZTAsset& asset) {
  if (asset.path().value_or("").empty()) {
    return _accessQueue.sync(
        [&] { return _restoreStatePropertyForKey(kRestoreStatePathKey, asset.identifier(), asset.version()); });
  }
  if (asset.path()->starts_with('/')) return *asset.path();
  return std::string(kPublicStaging) + "/" + *asset.path();
}

void AppsClient::_handleReceivedRestoreAsset(const std::shared_ptr<ZTAsset>& asset, InstallProgress* progress) {
  const std::string& identifier = asset->identifier();
  const bool hasOnlyItsData = asset->completedAssetParts() == platform::kZTAssetPartApplicationData;
  if (_useInstallCoordinator) {
    if (hasOnlyItsData) {
      _log.message(
          "%s|Not processing kZTAssetPartApplicationData for restore asset %{public}@ as coordination is enabled",
          identifier);
    } else {
      _log.message("%s|Not processing restore asset %{public}@ as coordination is enabled", identifier);
    }
    return;
  }
  if (hasOnlyItsData) {
    _enqueueAssetInstall(asset);  // The package has waited for its data; it lies where the restore state says.
    return;
  }
  if (!_backupManager->restoreDataExists(identifier, nullptr)) {
    _log.message("%s|No restore data exists for %{public}@", identifier);
    _enqueueAssetInstall(asset);
    return;
  }
  _log.message("%s|Restore data exists for %{public}@", identifier);
  if (progress != nullptr) progress->setInstallPhase(TSInstallPhase::RestoringData);
  _accessQueue.sync(
      [&] { _setRestoreStatePropertyValue(*asset->path(), kRestoreStatePathKey, identifier, asset->version()); });
}

void AppsClient::_handleFailedTransfer(const ZTAsset& asset, const std::optional<Error>& error, TransferMarks marks,
                                       InstallProgress* progress) {
  const std::string& identifier = asset.identifier();
  const bool isRecoverable = _isRecoverableError(error);
  _log.message("%s|failed to transfer asset %{public}@. err=%{public}@, recoverable=%d", asset.shortDescription(),
               error, isRecoverable);
  if (isRecoverable) {
    if (progress != nullptr) progress->setInstallState(TSInstallState::Failed);
    return;
  }
  platform::AppRegistry& registry = _platform.defaultRegistry();
  if (!registry.applicationIsInstalled(identifier) || asset.isRestore()) return;

  if (progress != nullptr && progress->installState() < TSInstallState::Canceled) progress->cancel();
  _log.message("%s|Uninstalling placeholder %{public}@", identifier);
  // Asked again: the daemon may have made it a restore since.
  if (asset.isRestore()) _cancelRestoreOfFailedTransfer(identifier);
  if (_useInstallCoordinator) {
    // A coordinator that the user has cancelled is gone.
    if (!marks.isUserCancelled) transferCompleteForApp(asset, error, marks.isExistingApp);
    return;
  }
  const Status uninstalled =
      registry.uninstallApplication(identifier, {{platform::kUninstallPlaceholdersOnlyKey, true}});
  _log.message("%s|Uninstalling app using TS %{public}@ %s", identifier, uninstalled ? "secceeded" : "failed");
}

void AppsClient::_cancelRestoreOfFailedTransfer(const std::string& identifier) {
  if (_useInstallCoordinator) {
    _log.message("%s|Install coordination is enabled - not calling cancelApplicationRestoreWithBundleID for %{public}@",
                 identifier);
  } else {
    _backupManager->cancelApplicationRestore(identifier, nullptr);
  }
}

}  // namespace appsync
