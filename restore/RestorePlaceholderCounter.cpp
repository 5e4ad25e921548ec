// Restore placeholders that are still awaited: each is in the set, in the count and in the group, or in none of them.
#include "core/AppsClient.h"

namespace appsync {

void AppsClient::dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(std::string_view bundleIdentifier) {
  _restoreQueue.sync([&] { _awaitPlaceholder(bundleIdentifier); });
}

Status AppsClient::dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(std::string_view bundleIdentifier,
                                                                        const std::function<Status()>& setPromise) {
  return _restoreQueue.sync([&] {
    Status set = setPromise();
    if (set) _awaitPlaceholder(bundleIdentifier);
    return set;
  });
}

void AppsClient::dataMigratorCancelledCoordinatorForRestoreAppBundle(std::string_view bundleIdentifier) {
  _restoreQueue.sync([&] {
    if (!_stopAwaitingPlaceholder(bundleIdentifier)) return;
    _log.message(
        "%s|DataMigrator cancelled coordinator for restoring app bundle %{public}@ _restoringPlaceholderCount %lld",
        bundleIdentifier, _restoringPlaceholderCount.load());
  });
}

void AppsClient::cnDidInstallPlaceHolderForAppBundle(std::optional<std::string_view> bundleIdentifier) {
  _restoreQueue.sync([&] {
    if (_finishedWaitingForPlaceHolderInstalls) return;
    if (bundleIdentifier && _stopAwaitingPlaceholder(*bundleIdentifier)) {
      _log.message("%s|CN finished installing placeholder for %{public}@, _restoringPlaceholderCount %lld",
                   *bundleIdentifier, _restoringPlaceholderCount.load());
    } else {
      _log.error("%s|Ignoring notification from CN about installing placeholder for %{public}@", bundleIdentifier);
    }
  });
}

/// On `_restoreQueue`. Once for each app.
void AppsClient::_awaitPlaceholder(std::string_view bundleIdentifier) {
  if (!_placeholdersForRestoringApps.emplace(bundleIdentifier).second) return;
  _restorePlaceHoldersWaitGroup.enter();
  ++_restoringPlaceholderCount;
  _log.message(
      "%s|DataMigrator will wait for CN to install placeholder for %{public}@, _restoringPlaceholderCount %lld",
      bundleIdentifier, _restoringPlaceholderCount.load());
}

/// On `_restoreQueue`. False when it was not awaited.
bool AppsClient::_stopAwaitingPlaceholder(std::string_view bundleIdentifier) {
  const auto awaited = _placeholdersForRestoringApps.find(bundleIdentifier);
  if (awaited == _placeholdersForRestoringApps.end()) return false;
  _restorePlaceHoldersWaitGroup.leave();
  --_restoringPlaceholderCount;
  _placeholdersForRestoringApps.erase(awaited);
  return true;
}

}  // namespace appsync
