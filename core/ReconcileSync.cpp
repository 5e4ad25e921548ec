#include <cerrno>

#include "common/TodoList.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

namespace {

using platform::IntermediateDirectories;

enum class Takeover { taken, nothingStaged, failed };

/// Moves the staging folder to the work area's path. Anything else than a folder is refused and stays staged.
Status moveStagingFolder(platform::FileSystem& files) {
  const auto staged = files.attributesOfItem(kStagingFolder);
  if (!staged) return staged.error();
  if (!staged->isDirectory) return Error::fromErrno(ENOTDIR, kStagingFolder);
  return files.moveItem(kStagingFolder, kWorkArea);
}

/// Makes the host's staging folder the work area, in place of the last sync's.
Takeover takeOverStagingFolder(platform::FileSystem& files, const PlugInLog& log, ErrorSlot error) {
  // Without a check before it: a dangling link at the path does not exist, but no folder can be moved there.
  files.removeItem(kWorkArea).ignore();

  if (const Status created = files.createDirectory(kSyncFolder, IntermediateDirectories::create, {}); !created) {
    setError(error, created.error());
    log.message("%s|can't create work area");
    return Takeover::failed;
  }
  if (!files.fileExists(kStagingFolder)) {
    log.message("%s|Nothing to do");
    return Takeover::nothingStaged;
  }
  if (const Status moved = moveStagingFolder(files); !moved) {
    setError(error, moved.error());
    log.message("%s|Can't move staging area");
    return Takeover::failed;
  }
  return Takeover::taken;
}

/// Returns the identifiers of the apps to remove, which refer to the list; empty if a restriction forbids removals.
std::vector<std::string_view> appsToRemove(const plist::Array& todoList, bool removalAllowed, const PlugInLog& log) {
  std::vector<std::string_view> identifiers;
  if (!removalAllowed) {
    log.message("%s|Not processing deletes because app removal is restricted");
    return identifiers;
  }
  identifiers.reserve(8);
  for (const plist::Value& entry : todoList) {
    const plist::Value* identifier = entry.find(todo::kIdentifier);
    if (!isValidBundleIdentifier(identifier) || !entryHas(entry, todo::kOperation, todo::kRemove)) continue;
    log.message("%s|%{public}@ targeted for termination", *identifier);
    identifiers.emplace_back(*identifier->string());
  }
  if (!identifiers.empty()) log.message("%s|performing %llu deletions", identifiers.size());
  return identifiers;
}

void uninstall(platform::Platform& platform, std::string_view identifier, const PlugInLog& log) {
  constexpr std::string_view kScenario = "Harvo Sync";
  const Status uninstalled = platform.defaultRegistry().uninstallApplication(identifier);
  if (!uninstalled) log.error("%s|Uninstall of %{public}@ failed.", identifier);
  platform.transactionLog().logScenario(kScenario, 0, uninstalled.ok(), identifier,
                                        uninstalled ? "Uninstall succeeded" : "Uninstall failed");
}

void sendIconLayout(platform::Platform& platform, const PlugInLog& log) {
  const auto layout = platform.fileSystem().readFile(kIconLayoutPath);
  if (!layout || layout->empty()) return;
  log.message("%s|Sending iconlayout to SV");
  platform::HomeScreenService& homeScreen = platform.homeScreen();
  homeScreen.setIconState(homeScreen.blockableServerPort(), *layout);
}

}  // namespace

bool AppsClient::reconcileSync(const platform::Assets&, std::string_view newAnchor, const platform::ProgressCallback&,
                               ErrorSlot error) {
  _log.message("%s|starting to reconcile sync with new anchor %{public}@", newAnchor);
  // On the queue: an install of the previous sync that is rewriting the old list must not overwrite the new one.
  const Takeover takeover =
      _accessQueue.sync([&] { return takeOverStagingFolder(_platform.fileSystem(), _log, error); });
  if (takeover == Takeover::taken) {
    const bool removalAllowed = _appRemovalAllowed();
    auto todoList = _loadPlist(_platform, kTodoListPath, error);
    if (todoList) {
      for (const std::string_view identifier : appsToRemove(*todoList, removalAllowed, _log)) {
        if (_useInstallCoordinator) {
          uninstallAppUsingCoordination(identifier);
        } else {
          uninstall(_platform, identifier, _log);
        }
      }
    } else {
      _log.message("%s|Nothing to do from Harvo");
    }
    _notifySolvary(_platform, true);
    sendIconLayout(_platform, _log);
    // A copy for debugging: the host's requests as they were.
    if (todoList) todo::save(_platform.fileSystem(), kTodoListDebugPath, std::move(*todoList)).ignore();
  }
  _log.message("%s|finished reconcile sync");
  return takeover != Takeover::failed;
}

}  // namespace appsync
