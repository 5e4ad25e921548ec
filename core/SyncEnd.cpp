// The end of the transfers, the end of the sync, and the removal of all sync data.
#include "base/Semaphore.h"
#include "common/InstallNames.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

namespace {

using platform::TSInstallState;

/// Blocks until the store has replied.
void refreshReceipts(platform::Platform& platform, const PlugInLog& log) {
  const auto library = platform.makeSoftwareLibrary();
  Semaphore answered(platform.clock(), 0);
  library->refreshReceipts([&](const std::optional<Error>& error) {
    if (error) {
      log.message("%s|refreshReceiptsWithCompletionBlock failed: %{public}@", *error);
    } else {
      log.message("%s|refreshReceiptsWithCompletionBlock succeeded");
    }
    answered.signal();
  });
  answered.wait();
}

/// Ends the loading phase of transfers that were never completed.
void closeTransfers(AppsClient& client, platform::AppRegistry& registry, const PlugInLog& log,
                    const IdentifierSet& identifiers, bool success) {
  const TSInstallState state = success ? TSInstallState::Finished : TSInstallState::Failed;
  for (const std::string& identifier : identifiers) {
    log.message("%s|Setting state for outstanding DCX loading phase of asset %{public}@ to %{public}@", identifier,
                state);
    const auto progress = client._progressForAssetIdentifier(identifier);
    if (!progress) continue;
    progress->setInstallState(state);
    registry.installPhaseFinishedForProgress(*progress);
  }
}

}  // namespace

void AppsClient::assetTransferEndedWithSuccess(bool success) {
  _log.message("%s|asset transfer ended withsuccess: %c", success);
  _installGroup->wait();
  _notifySolvary(_platform, false);
  if (_getAndResetNumAppInstallsAttempted() >= 1) refreshReceipts(_platform, _log);

  std::unique_lock lock(_outstandingMutex);
  const IdentifierSet outstanding = _outstandingDCXTransfers;
  lock.unlock();
  if (outstanding.empty()) return;
  if (_useInstallCoordinator) {
    assetSyncFinishedWithStatus(success, outstanding);
  } else {
    closeTransfers(*this, _platform.defaultRegistry(), _log, outstanding, success);
  }
  if (success) {
    _log.error("%s|Called with success == YES but with %lu outstanding DCX transfers!", outstanding.size());
  }
  lock.lock();
  _outstandingDCXTransfers.clear();
  lock.unlock();
  _accessQueue.sync([this] {
    _updatingApps.clear();
    _userCancelledApps.clear();
  });
}

void AppsClient::syncEndedWithSuccess(bool success) {
  _log.message("%s|sync ended with success: %c", success);
  if (!success) return;

  platform::FileSystem& files = _platform.fileSystem();
  if (const Status touched = files.touch(kSyncFolder); !touched) {
    _log.error("%s|Failed to update utimes of \"%s\": %s", kSyncFolder, touched.error().text);
  }
  if (_uninstalledApps) {
    _log.message("%s|clearing uninstalled apps: %{public}@", *_uninstalledApps);
    if (_platform.uninstalledApps().clearUninstalled(*_uninstalledApps) == 0) {
      _uninstalledApps.reset();
    } else {
      _log.error("%s|Failed to clear uninstalled apps from Instavor.");
    }
  }
  files.removeItem(kLastSyncStatePath).ignore();
}

void AppsClient::clearSyncData() {
  _log.message("%s|blasting work area");
  // On the queue: a coordinated install that writes one of the files would recreate the folder.
  _accessQueue.sync([this] { _platform.fileSystem().removeItem(kSyncFolder).ignore(); });

  _log.message("%s|Uninstalling all placeholder apps");
  _enumeratePlaceholdersWithBlock([this](const platform::AppRecord& record, bool&) {
    const std::string identifier = record.bundleIdentifier().value_or(record.applicationIdentifier());
    const bool uninstalled = _platform.defaultRegistry().uninstallApplication(identifier).ok();
    _log.message("%s|Uninstall %{public}@ = %c", identifier, uninstalled);
  });

  platform::UninstalledAppsList& list = _platform.uninstalledApps();
  const auto uninstalled = list.lookupUninstalled();
  if (!uninstalled) {
    _log.error("%s|Failed to fetch uninstalled apps list to clear it");
  } else if (list.clearUninstalled(keysOf(*uninstalled)) != 0) {
    _log.error("%s|Failed to clear uninstalled apps list");
  }
}

}  // namespace appsync
