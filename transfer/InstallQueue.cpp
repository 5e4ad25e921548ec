// Installing received packages, ten at a time, each held by the home screen.
#include <cerrno>
#include <chrono>
#include <system_error>
#include <utility>

#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "transfer/TerminationAssertionRules.h"

namespace appsync {

namespace {

using platform::TerminationAssertionOutcome;
using platform::ZTAsset;

constexpr std::string_view kInstallScenario = "Asset install";
constexpr std::string_view kRestoreScenario = "Nimbra restore";
constexpr std::chrono::seconds kRetryDelay{30};
/// Remains if the home screen sets no outcome: an unknown failure.
constexpr TerminationAssertionOutcome kNoOutcome{0xFF};

/// What an install owns while it is queued, runs or waits for a retry. The group is left last: its waiter may then
/// destroy the client, the assets and the platform.
struct PendingInstall {
  std::shared_ptr<const GroupEntry> groupEntry;
  std::shared_ptr<ZTAsset> asset;
  std::shared_ptr<AppsClient> client;
};

void logAssertion(const PlugInLog& log, TerminationAssertionOutcome outcome, const std::string& identifier) {
  switch (outcome) {
    case TerminationAssertionOutcome::granted:
      return log.message("%s|Assertion succeeded for %{public}@", identifier);
    case TerminationAssertionOutcome::notFound:
      return log.message("%s|Assertion not found for %{public}@, installing anyway...", identifier);
    case TerminationAssertionOutcome::denied:
      return log.error("%s|Assertion denied for %{public}@", identifier);
  }
  log.error("%s|Unknown error %d getting assertion for %{public}@", static_cast<int>(outcome), identifier);
}

/// Removes nothing if the asset has no path.
void removePackage(platform::FileSystem& files, const ZTAsset& asset) {
  const std::string path = asset.path().value_or("");
  if (!path.empty()) files.removeItem(path).ignore();
}

/// Reports an install for which the system has no thread as a failed install; nothing is thrown to the daemon.
void failInstall(AppsClient& client, platform::FileSystem& files, const ZTAsset& asset,
                 const std::system_error& noThread) {
  client.assetInstallFailed(asset, {std::string(domains::kPOSIX), noThread.code().value(), noThread.what(), {}});
  removePackage(files, asset);
}

Status installPackage(platform::AppRegistry& registry, const ZTAsset& asset) {
  const platform::FileLocation package{asset.path().value_or("")};
  return registry.installApplication(package, {{platform::PackageTypeKey, platform::kPackageTypeCustomer},
                                               {platform::BundleIdentifierKey, asset.identifier()}});
}

/// Does nothing but log if installs are coordinated.
void cancelRestore(platform::BackupManager& backups, const std::string& identifier, bool useInstallCoordinator,
                   const PlugInLog& log) {
  if (useInstallCoordinator) {
    log.message("%s|not asking backup manager to cancel app restore for %{public}@ as install coordination is enabled",
                identifier);
  } else {
    backups.cancelApplicationRestore(identifier, nullptr);
  }
}

void removeFailedInstall(AppsClient& client, platform::Platform& platform, const ZTAsset& asset,
                         bool useInstallCoordinator, const PlugInLog& log) {
  const std::string& identifier = asset.identifier();
  if (useInstallCoordinator && asset.isRestore()) {
    log.message("%s|not uninstalling restore asset %{public}@ as install coordination is enabled", identifier);
    return;
  }
  if (useInstallCoordinator) {
    client.uninstallAppUsingCoordination(identifier);
    return;
  }
  const Status removed = platform.defaultRegistry().uninstallApplication(identifier);
  if (!removed) log.error("%s|Uninstall of %{public}@ failed.", identifier);
  platform.transactionLog().logScenario(kRestoreScenario, 0, removed.ok(), identifier,
                                        removed ? "placeholder removed" : "failed to remove placeholder");
}

}  // namespace

void AppsClient::_enqueueAssetInstall(const std::shared_ptr<ZTAsset>& asset) {
  const PendingInstall install{std::make_shared<GroupEntry>(_installGroup), asset, shared_from_this()};
  _log.message("%s|Enqueue install request for %{public}@", asset->identifier());
  try {
    _installOperationQueue.add([install] {
      AppsClient& client = *install.client;
      const std::string& identifier = install.asset->identifier();
      client._log.message("%s|Performing install for %{public}@", identifier);
      client._performAssetInstall(install.asset);
      client._log.message("%s|Finished install for %{public}@", identifier);
      client._accessQueue.sync([&] { client.cleanRestoreStateForIdentifier(identifier); });
    });
  } catch (const std::system_error& noThread) {
    failInstall(*this, _platform.fileSystem(), *asset, noThread);
  }
}

void AppsClient::_performAssetInstall(const std::shared_ptr<ZTAsset>& asset) {
  const std::string& identifier = asset->identifier();
  _log.message("%s|Grabbing assertion for %{public}@", identifier);
  auto outcome = kNoOutcome;
  auto assertion = _platform.homeScreen().terminationAssertionCreate(identifier, 0, outcome);

  logAssertion(_log, outcome, identifier);
  const AssertionRule rule = assertionRule(outcome);
  _platform.transactionLog().logScenario(kInstallScenario, 0, rule.isSuccess, identifier, rule.description);
  if (rule.action == AssertionAction::install) {
    const Status installed = installPackage(_platform.defaultRegistry(), *asset);
    if (installed) {
      assetInstallSucceeded(*asset);
    } else {
      assetInstallFailed(*asset, installed.error());
    }
    _numAppInstallsAttempted.fetch_add(1, std::memory_order_relaxed);
  }
  if (rule.action == AssertionAction::fail) assetInstallFailed(*asset, {std::string(domains::kPOSIX), EINVAL, {}, {}});

  assertion.reset();
  if (rule.action == AssertionAction::retryLater) {
    _scheduleInstallRetry(asset);
  } else {
    removePackage(_platform.fileSystem(), *asset);
  }
}

void AppsClient::_scheduleInstallRetry(const std::shared_ptr<ZTAsset>& asset) {
  const std::string& identifier = asset->identifier();
  _log.error("%s|Will retry installation of %{public}@ in %d seconds", identifier,
             static_cast<int>(kRetryDelay.count()));
  _platform.transactionLog().logScenario(kInstallScenario, 0, true, identifier, "retrying asset install");
  const PendingInstall install{std::make_shared<GroupEntry>(_installGroup), asset, shared_from_this()};
  try {
    _platform.scheduler().after(kRetryDelay, [install] {
      install.client->_log.error("%s|Re-enqueue installation request for %{public}@", install.asset->identifier());
      install.client->_enqueueAssetInstall(install.asset);
    });
  } catch (const std::system_error& noThread) {
    failInstall(*this, _platform.fileSystem(), *asset, noThread);
  }
}

void AppsClient::assetInstallSucceeded(const ZTAsset& asset) {
  const std::string& identifier = asset.identifier();
  _log.message("%s|%{public}@ install succeeded", identifier);
  _accessQueue.sync([&] {
    changeAssetID(identifier, todo::kInstalled);
    cleanRestoreStateForIdentifier(identifier);
  });
}

void AppsClient::assetInstallFailed(const ZTAsset& asset, const Error& error) {
  const std::string& identifier = asset.identifier();
  if (_isRecoverableError(error) || asset.isRestore()) {
    _log.message("%s|%{public}@ install failed but was recoverable: %{public}@", identifier, error);
    _platform.transactionLog().logScenario(kRestoreScenario, 0, false, identifier, "install failed recoverably");
  } else {
    _log.message("%s|%{public}@ install failed unrecoverably: %{public}@", identifier, error);
    _accessQueue.sync([&] { changeAssetID(identifier, todo::kFailed); });
    // Asked again: the daemon may have made it a restore since.
    if (asset.isRestore()) cancelRestore(*_backupManager, identifier, _useInstallCoordinator, _log);
    removeFailedInstall(*this, _platform, asset, _useInstallCoordinator, _log);
  }
  _accessQueue.sync([&] { cleanRestoreStateForIdentifier(identifier); });
}

bool AppsClient::_isRecoverableError(const std::optional<Error>& error) {
  if (_useInstallCoordinator) {
    _log.message("%s|Choreon is enabled - treating error %{public}@ as non recoverable", error);
    return false;
  }
  if (!error || !_platform.syncFramework().ZTIsRecoverableError(*error)) return false;
  return error->domain != platform::kInstallerErrorDomain && error->domain != "TessalyError";
}

}  // namespace appsync
