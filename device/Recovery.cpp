#include "device/Recovery.h"

#include <optional>
#include <string>
#include <unordered_set>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <sys/stat.h>

#include "base/ReturnIfError.h"
#include "device/apps/AppData.h"
#include "device/apps/AppRecord.h"
#include "device/apps/AppTable.h"
#include "device/coordination/CoordinatorTable.h"
#include "device/packages/BundleInfo.h"
#include "device/storage/FileTree.h"
#include "device/storage/SystemCalls.h"
#include "platform/SyncFiles.h"

namespace appsync::device {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

namespace {

using Identifiers = std::unordered_set<std::string>;

/// The apps whose placeholders belong to a coordinator, or did until `reconcileCoordinators`.
struct CoordinatedPlaceholders {
  Identifiers owned;
  Identifiers orphaned;
  /// The paths of the coordinators' packages.
  std::unordered_set<std::string> packages;
};

/// Removes the coordinators of a sync if coordination is off.
Result<CoordinatedPlaceholders> reconcileCoordinators(Database::Session& session, bool coordinationIsOn) {
  const auto coordinators = coordinator_table::all(session);
  if (!coordinators) return coordinators.error();
  CoordinatedPlaceholders placeholders;
  for (const auto& coordinator : *coordinators) {
    const bool isOver = !coordinationIsOn && coordinator->creator == platform::ClientIdentity::CXClientSync;
    if (coordinator->showsPlaceholder()) {
      (isOver ? placeholders.orphaned : placeholders.owned).insert(coordinator->identifier);
    }
    if (isOver) {
      RETURN_IF_ERROR(coordinator_table::remove(session, *coordinator));
    } else if (const auto package = coordinator->ownPackage()) {
      placeholders.packages.insert(*package);
    }
  }
  return placeholders;
}

bool containerExists(int containers, const StoredBundle& bundle) {
  struct stat status {};
  return fstatat(containers, bundle.container.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 && S_ISDIR(status.st_mode);
}

/// A power failure can leave an empty file if the write was not durable.
bool hasInfo(int containers, const StoredBundle& bundle) {
  const std::string path = bundle.container + '/' + bundle.folder + '/' + std::string(kInfoPlistName);
  struct stat status {};
  return fstatat(containers, path.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 && status.st_size > 0;
}

/// Returns whether a bundle's record is kept. Coordinators recreate the placeholders that they lose.
bool stays(int containers, const AppRow& app, BundleRole role, const CoordinatedPlaceholders& coordinated) {
  const StoredBundle& bundle = *app.bundle(role);
  if (!containerExists(containers, bundle)) return false;
  if (role == BundleRole::installed) return true;
  if (coordinated.owned.contains(app.identifier)) return hasInfo(containers, bundle);
  if (bundle.installType == TSInstallType::Sync) return false;
  // A demoted app keeps its placeholder when its coordinator is removed.
  return isDemotion(bundle.installType) || !coordinated.orphaned.contains(app.identifier);
}

/// Returns the progress from which an interrupted install resumes, or nullopt if none does: an active install waits,
/// the package is loaded again, a paused install stays paused. The interrupted install of a demoted app has ended.
std::optional<ProgressValues> resumed(const AppRow& app, bool hasPlaceholder, bool hasCoordinator) {
  if (!hasPlaceholder || !app.progress) return std::nullopt;
  if (isDemotion(app.placeholder->installType) && !hasCoordinator) return std::nullopt;
  ProgressValues values = *app.progress;
  if (values.state == TSInstallState::Active) values.state = TSInstallState::Waiting;
  if (values.phase == TSInstallPhase::Installing) values.phase = TSInstallPhase::Loading;
  if (values.phase == TSInstallPhase::Loading) values.completedUnits = 0;
  return values;
}

/// Removes stale records. Adds the containers of the others to `kept` and the packages of coordinators to `packages`.
Status reconcileRecords(Database& database, int containers, bool coordinationIsOn,
                        std::unordered_set<std::string>& kept, std::unordered_set<std::string>& packages) {
  Database::Transaction transaction(database);
  Result<CoordinatedPlaceholders> coordinated = reconcileCoordinators(transaction, coordinationIsOn);
  if (!coordinated) return coordinated.error();
  packages = std::move(coordinated->packages);
  const Result<std::vector<AppRow>> apps = app_table::all(transaction);
  if (!apps) return apps.error();
  for (const AppRow& app : *apps) {
    bool hasPlaceholder = false;
    for (const BundleRole role : {BundleRole::installed, BundleRole::placeholder}) {
      const std::optional<StoredBundle>& bundle = app.bundle(role);
      if (!bundle) continue;
      if (stays(containers, app, role, *coordinated)) {
        kept.insert(bundle->container);
        hasPlaceholder = role == BundleRole::placeholder;
      } else {
        RETURN_IF_ERROR(app_table::remove(transaction, app, role));
      }
    }
    const std::optional<ProgressValues> progress =
        resumed(app, hasPlaceholder, coordinated->owned.contains(app.identifier));
    if (progress == app.progress) continue;
    RETURN_IF_ERROR(app_table::storeProgress(transaction, app.identifier, progress));
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
    if (const int error = tree::remove(containers, stray.c_str(), work); error != 0) return error;
  }
  return entries.failure();
}

/// Removes spent packages, except those whose path a coordinator uses again.
Status sweepPackages(Database& database, DeviceFileSystem& files, const std::unordered_set<std::string>& needed) {
  Database::Transaction transaction(database);
  const Result<std::vector<std::string>> spent = coordinator_table::spentPackages(transaction);
  if (!spent) return spent.error();
  for (const std::string& path : *spent) {
    const Result<RootDirectory::Place> place = files.root().place(path);
    if (place && !needed.contains(path)) {
      static_cast<void>(sys::removeFile(place->folder.get(), place->name.c_str()));
    }
    coordinator_table::forgetSpentPackage(transaction, path).ignore();
  }
  return transaction.commit();
}

}  // namespace

Status recover(Database& database, DeviceFileSystem& files, Settings& settings) {
  const Result<FileDescriptor> containers = files.root().open(kContainersPath, O_RDONLY | O_DIRECTORY);
  if (!containers) return containers.error();
  const Result<FileDescriptor> temporary =
      files.root().open(DeviceFileSystem::kTemporaryDirectory, O_RDONLY | O_DIRECTORY);
  if (!temporary) return temporary.error();
  std::unordered_set<std::string> kept;
  std::unordered_set<std::string> packages;
  const bool coordinationIsOn = settings.coordinationIsOn();
  RETURN_IF_ERROR(reconcileRecords(database, containers->get(), coordinationIsOn, kept, packages));
  RETURN_IF_ERROR(sweepPackages(database, files, packages));
  RETURN_IF_ERROR(app_data::recover(files, database));
  int error = sweepContainers(containers->get(), kept, files.work());
  if (error == 0) error = tree::empty(temporary->get(), files.work());
  if (error == 0) error = tree::empty(files.work(), files.work());
  if (error != 0) return Error::fromErrno(error, "the files that a crash left");
  return {};
}

}  // namespace appsync::device
