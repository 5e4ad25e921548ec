#include <unordered_set>

#include "base/SeededHash.h"
#include "common/TodoList.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

namespace {

/// The todo list's entry of an app that is not on the device.
struct TodoState {
  bool found = false;
  bool failed = false;
  bool installed = false;

  TodoState(const todo::Index& todoList, std::string_view identifier) {
    const plist::Value* entry = todoList.find(identifier);
    if (entry == nullptr) return;
    found = true;
    failed = entryHas(*entry, todo::kOperation, todo::kFailed);
    installed = entryHas(*entry, todo::kOperation, todo::kInstalled);
  }

  /// The host's request is neither done nor failed.
  [[nodiscard]] bool isPending() const { return found && !failed && !installed; }
};

}  // namespace

plist::Dictionary AppsClient::installedAssets() {
  _log.message("%s|getting installed assets");
  const auto todoList = _loadPlist(_platform, kTodoListPath, nullptr);
  const auto lastSyncState = _loadPlist(_platform, kLastSyncStatePath, nullptr);

  // Each identifier once, in order. Refer to the two lists.
  std::vector<std::string_view> candidates;
  std::unordered_set<std::string_view, SeededHash> seen;
  const auto addCandidate = [&](std::string_view identifier) {
    if (seen.insert(identifier).second) candidates.push_back(identifier);
  };
  if (const auto uninstalled = _platform.uninstalledApps().lookupUninstalled()) {
    _uninstalledApps = keysOf(*uninstalled);
    for (const std::string& identifier : *_uninstalledApps)
      addCandidate(identifier);
  } else {
    _log.error("%s|InstavorLookupUninstalled returned NULL");
  }
  if (lastSyncState) {
    for (const plist::Value& value : *lastSyncState) {
      const auto identifier = value.string();
      if (identifier && !_platform.defaultRegistry().applicationIsInstalled(*identifier)) addCandidate(*identifier);
    }
  }

  const todo::Index index(todoList);
  plist::Array deleted;
  for (const std::string_view candidate : candidates) {
    const TodoState state(index, candidate);
    if (state.isPending()) {
      _log.message("%s|%{public}@ not installed, but is in our todo list. Not marking deleted", candidate);
      continue;
    }
    _log.message("%s|%{public}@ not installed, and no todo (found=%d pi=%d failed=%d) Marking as deleted", candidate,
                 state.found, state.installed, state.failed);
    deleted.emplace_back(plist::Dictionary{{platform::BundleIdentifierKey, candidate}});
  }
  plist::Dictionary result{{kDeletedKey, std::move(deleted)}};
  _log.summary(
      "%s|finished getting installed assets toDoList:%{public}@, uninstalled apps %{public}@, last synced apps%{public}@",
      todoList, _uninstalledApps, lastSyncState);
  return result;
}

}  // namespace appsync
