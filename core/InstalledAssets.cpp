#include <unordered_set>

#include "base/SeededHash.h"
#include "common/TodoList.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

namespace {

constexpr std::string_view kDeletedKey = "_Deleted";

/// Identifiers in the order in which they first came; each once. Refers to what it was filled from.
class CandidateSet {
 public:
  void insert(std::string_view identifier) {
    if (seen_.insert(identifier).second) inOrder_.push_back(identifier);
  }

  [[nodiscard]] auto begin() const { return inOrder_.begin(); }
  [[nodiscard]] auto end() const { return inOrder_.end(); }

 private:
  std::unordered_set<std::string_view, SeededHash> seen_;
  std::vector<std::string_view> inOrder_;
};

void addIdentifiersNoLongerInstalled(const plist::Array& lastSyncState, platform::AppRegistry& registry,
                                     CandidateSet& candidates) {
  for (const plist::Value& value : lastSyncState) {
    const auto identifier = value.string();
    if (identifier && !registry.applicationIsInstalled(*identifier)) candidates.insert(*identifier);
  }
}

/// What the host's todo list says of an app that is not on the device.
struct TodoState {
  bool found = false;
  bool failed = false;
  bool installed = false;

  TodoState(const TodoIndex& todoList, std::string_view identifier) {
    const plist::Value* entry = todoList.firstEntry(identifier);
    if (entry == nullptr) return;
    found = true;
    failed = entryHas(*entry, todo::kOperation, todo::kFailed);
    installed = entryHas(*entry, todo::kOperation, todo::kInstalled);
  }

  /// The host still has work of its own to do on the app.
  [[nodiscard]] bool isPending() const { return found && !failed && !installed; }
};

}  // namespace

plist::Dictionary AppsClient::installedAssets() {
  _log.message("%s|getting installed assets");
  const auto todoList = _loadPlist(_platform, kTodoListPath, nullptr);
  const auto lastSyncState = _loadPlist(_platform, kLastSyncStatePath, nullptr);

  CandidateSet candidates;
  if (const auto uninstalled = _platform.uninstalledApps().lookupUninstalled()) {
    _uninstalledApps = keysOf(*uninstalled);
    for (const std::string& identifier : *_uninstalledApps)
      candidates.insert(identifier);
  } else {
    _log.error("%s|InstavorLookupUninstalled returned NULL");
  }
  if (lastSyncState) addIdentifiersNoLongerInstalled(*lastSyncState, _platform.defaultRegistry(), candidates);

  const TodoIndex index(todoList);
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
