// Restore placeholders that are still awaited. Each is in the set, in the count and in the group, or in none of them;
// the three change together, on `_restoreQueue`.
#include "core/AppsClient.h"

namespace appsync {

namespace {

/// Does nothing for a placeholder that is awaited already.
void awaitPlaceholder(std::string_view identifier, IdentifierSet& awaited, std::atomic<std::int64_t>& count,
                      Group& group, const PlugInLog& log) {
  if (!awaited.emplace(identifier).second) return;
  group.enter();
  ++count;
  log.message("%s|DataMigrator will wait for CN to install placeholder for %{public}@, _restoringPlaceholderCount %lld",
              identifier, count.load());
}

/// Returns false for a placeholder that is not awaited.
bool stopAwaiting(std::string_view identifier, IdentifierSet& awaited, std::atomic<std::int64_t>& count, Group& group) {
  const auto found = awaited.find(identifier);
  if (found == awaited.end()) return false;
  group.leave();
  --count;
  awaited.erase(found);
  return true;
}

}  // namespace

void AppsClient::dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(std::string_view bundleIdentifier) {
  _awaitPlaceholderAfter([] { return Status(); }, bundleIdentifier).ignore();
}

Status AppsClient::_awaitPlaceholderAfter(const std::function<Status()>& setPromise,
                                          std::string_view bundleIdentifier) {
  return _restoreQueue.sync([&] {
    Status set = setPromise();
    if (set) {
      awaitPlaceholder(bundleIdentifier, _placeholdersForRestoringApps, _restoringPlaceholderCount,
                       _restorePlaceHoldersWaitGroup, _log);
    }
    return set;
  });
}

void AppsClient::dataMigratorCancelledCoordinatorForRestoreAppBundle(std::string_view bundleIdentifier) {
  _restoreQueue.sync([&] {
    const bool wasAwaited = stopAwaiting(bundleIdentifier, _placeholdersForRestoringApps, _restoringPlaceholderCount,
                                         _restorePlaceHoldersWaitGroup);
    if (!wasAwaited) return;
    _log.message(
        "%s|DataMigrator cancelled coordinator for restoring app bundle %{public}@ _restoringPlaceholderCount %lld",
        bundleIdentifier, _restoringPlaceholderCount.load());
  });
}

void AppsClient::cnDidInstallPlaceHolderForAppBundle(std::optional<std::string_view> bundleIdentifier) {
  _restoreQueue.sync([&] {
    if (_finishedWaitingForPlaceHolderInstalls) return;
    if (bundleIdentifier && stopAwaiting(*bundleIdentifier, _placeholdersForRestoringApps, _restoringPlaceholderCount,
                                         _restorePlaceHoldersWaitGroup)) {
      _log.message("%s|CN finished installing placeholder for %{public}@, _restoringPlaceholderCount %lld",
                   *bundleIdentifier, _restoringPlaceholderCount.load());
    } else {
      _log.error("%s|Ignoring notification from CN about installing placeholder for %{public}@", bundleIdentifier);
    }
  });
}

}  // namespace appsync
