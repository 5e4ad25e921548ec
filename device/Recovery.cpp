#include "device/Recovery.h"

#include <optional>
#include <string>
#include <unordered_set>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <sys/stat.h>

#include "device/AppRecord.h"
#include "device/AppTable.h"
#include "device/FileTree.h"

namespace appsync::device {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

namespace {

bool containerExists(int containers, const StoredBundle& bundle) {
  struct stat status {};
  return fstatat(containers, bundle.container.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 && S_ISDIR(status.st_mode);
}

/// Whether a record may keep its bundle.
bool stays(int containers, BundleRole role, const StoredBundle& bundle) {
  if (role == BundleRole::placeholder && bundle.installType == TSInstallType::Sync) return false;
  return containerExists(containers, bundle);
}

/// An install that nobody drives any more waits; what was being unpacked must come again, what was parked has not
/// moved.
std::optional<ProgressValues> resumed(const AppRow& app, bool hasPlaceholder) {
  if (!hasPlaceholder || !app.progress) return std::nullopt;
  ProgressValues values = *app.progress;
  if (values.state == TSInstallState::Active) values.state = TSInstallState::Waiting;
  if (values.phase == TSInstallPhase::Installing) values.phase = TSInstallPhase::Loading;
  if (values.phase == TSInstallPhase::Loading) values.completedUnits = 0;
  return values;
}

/// Takes away what may not stay; `kept` receives the containers of what may.
Status reconcileRecords(Database& database, int containers, std::unordered_set<std::string>& kept) {
  Database::Transaction transaction(database);
  const Result<std::vector<AppRow>> apps = app_table::all(transaction);
  if (!apps) return apps.error();
  for (const AppRow& app : *apps) {
    bool hasPlaceholder = false;
    for (const BundleRole role : {BundleRole::installed, BundleRole::placeholder}) {
      const std::optional<StoredBundle>& bundle = app.bundle(role);
      if (!bundle) continue;
      if (stays(containers, role, *bundle)) {
        kept.insert(bundle->container);
        hasPlaceholder = role == BundleRole::placeholder;
      } else if (Status removed = app_table::remove(transaction, app, role); !removed) {
        return removed;
      }
    }
    const std::optional<ProgressValues> progress = resumed(app, hasPlaceholder);
    if (progress == app.progress) continue;
    if (Status stored = app_table::storeProgress(transaction, app.identifier, progress); !stored) return stored;
  }
  return transaction.commit();
}

int sweepContainers(int containers, const std::unordered_set<std::string>& kept, int work) {
  std::vector<std::string> strays;
  FolderEntries entries(containers);
  while (const char* name = entries.next()) {
    if (!kept.contains(name)) strays.emplace_back(name);
  }
  for (const std::string& stray : strays) {
    if (const int number = tree::remove(containers, stray.c_str(), work); number != 0) return number;
  }
  return entries.failure();
}

}  // namespace

Status recover(Database& database, DeviceFileSystem& files) {
  const Result<FileDescriptor> containers = files.root().open(kContainersPath, O_RDONLY | O_DIRECTORY);
  if (!containers) return containers.error();
  const Result<FileDescriptor> temporary =
      files.root().open(DeviceFileSystem::kTemporaryDirectory, O_RDONLY | O_DIRECTORY);
  if (!temporary) return temporary.error();
  std::unordered_set<std::string> kept;
  if (Status reconciled = reconcileRecords(database, containers->get(), kept); !reconciled) return reconciled;
  int number = sweepContainers(containers->get(), kept, files.work());
  if (number == 0) number = tree::empty(temporary->get(), files.work());
  if (number == 0) number = tree::empty(files.work(), files.work());
  if (number != 0) return Error::fromErrno(number, "what a crash left behind");
  return {};
}

}  // namespace appsync::device
