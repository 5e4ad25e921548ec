#include "device/apps/AppRegistry.h"

#include <utility>

#include "device/packages/InstallerError.h"
#include "device/storage/Database.h"
#include "plist/Access.h"

namespace appsync::device {

using platform::BundleKind;

AppRegistry::AppRegistry(Database& database, DeviceFileSystem& files, Access access)
    : database_(database),
      access_(access),
      running_(std::make_shared<RunningInstalls>(database, observers_)),
      installer_(database, files, *running_),
      observers_([this] { return running_->order(); }) {
  if (access == Access::exclusive) running_->resume();
}

void AppRegistry::addObserver(platform::AppRegistryObserver& observer) {
  observers_.add(observer);
}

void AppRegistry::removeObserver(platform::AppRegistryObserver& observer) {
  observers_.remove(observer);
}

std::optional<AppRow> AppRegistry::find(std::string_view bundleIdentifier) {
  Database::Session session(database_);
  Result<std::optional<AppRow>> found = app_table::find(session, bundleIdentifier);
  return found ? std::move(found).value() : std::nullopt;
}

std::shared_ptr<const AppRecord> AppRegistry::recordOf(AppRow row) {
  std::shared_ptr<platform::InstallProgress> progress;
  if (access_ == Access::exclusive) {
    progress = running_->find(row.identifier);
  } else if (row.progress) {
    progress = std::make_shared<InstallProgress>(row.identifier, *row.progress);
  }
  return std::make_shared<AppRecord>(std::move(row), std::move(progress));
}

bool AppRegistry::applicationIsInstalled(std::string_view bundleIdentifier) {
  return find(bundleIdentifier).has_value();
}

std::shared_ptr<const platform::AppRecord> AppRegistry::recordForIdentifier(std::string_view bundleIdentifier,
                                                                            platform::PlaceholderLookup placeholders) {
  std::optional<AppRow> row = find(bundleIdentifier);
  if (!row || (placeholders == platform::PlaceholderLookup::off && !row->installed)) return nullptr;
  return recordOf(*std::move(row));
}

void AppRegistry::enumerateBundlesOfType(
    BundleKind kind, const std::function<void(const platform::BundleRecord& bundle, bool& stop)>& visit) {
  std::vector<AppRow> rows;
  {
    Database::Session session(database_);
    Result<std::vector<AppRow>> found = kind == BundleKind::all ? app_table::all(session)
                                        : kind == BundleKind::user
                                            ? app_table::ofType(session, platform::kApplicationTypeUser)
                                            : app_table::ofType(session, platform::kApplicationTypeSystem);
    if (!found) return;
    rows = std::move(found).value();
  }
  bool stop = false;
  for (AppRow& row : rows) {
    visit(*recordOf(std::move(row)), stop);
    if (stop) return;
  }
}

Status AppRegistry::installApplication(const platform::FileLocation& location, const plist::Dictionary& options) {
  Status installed = installer_.install(location, options, platform::kApplicationTypeUser);
  if (const auto identifier = stringIn(options.find(platform::BundleIdentifierKey)))
    noteOutcome(*identifier, installed);
  return installed;
}

Status AppRegistry::installPackage(const platform::FileLocation& location, const InstallRequest& request) {
  Status installed = installer_.installPackage(location, request, platform::kApplicationTypeUser);
  noteOutcome(request.identifier, installed);
  return installed;
}

void AppRegistry::noteOutcome(std::string_view bundleIdentifier, const Status& installed) {
  const std::lock_guard lock(failuresMutex_);
  if (installed) {
    failures_.erase(std::string(bundleIdentifier));
  } else {
    failures_.insert_or_assign(std::string(bundleIdentifier), installed.error());
  }
}

Status AppRegistry::recordPlaceholder(PendingContainer& container, const InstallRequest& request, StoredBundle bundle) {
  return installer_.recordPlaceholder(container, request, platform::kApplicationTypeUser, std::move(bundle));
}

Status AppRegistry::removePlaceholder(std::string_view bundleIdentifier, const TransactionHook& transactionHook) {
  return installer_.uninstall(bundleIdentifier, {{platform::kUninstallPlaceholdersOnlyKey, true}}, transactionHook);
}

std::optional<Error> AppRegistry::lastInstallFailure(std::string_view bundleIdentifier) {
  const std::lock_guard lock(failuresMutex_);
  const auto found = failures_.find(bundleIdentifier);
  return found == failures_.end() ? std::nullopt : std::optional(found->second);
}

Status AppRegistry::installSystemApplication(const platform::FileLocation& location, const plist::Dictionary& options) {
  return installer_.install(location, options, platform::kApplicationTypeSystem);
}

Status AppRegistry::uninstallApplication(std::string_view bundleIdentifier, const plist::Dictionary& options) {
  return installer_.uninstall(bundleIdentifier, options);
}

std::shared_ptr<platform::InstallProgress> AppRegistry::installProgressForApplication(const platform::AppRecord& record,
                                                                                      platform::TSInstallPhase) {
  return running_->find(record.applicationIdentifier());
}

void AppRegistry::installPhaseFinishedForProgress(platform::InstallProgress& progress) {
  running_->phaseFinished(progress);
}

Result<std::vector<std::shared_ptr<const AppRecord>>> AppRegistry::apps() {
  Result<std::vector<AppRow>> rows = [this] {
    Database::Session session(database_);
    return app_table::all(session);
  }();
  if (!rows) return rows.error();
  std::vector<std::shared_ptr<const AppRecord>> records;
  records.reserve(rows->size());
  for (AppRow& row : *rows)
    records.push_back(recordOf(std::move(row)));
  return records;
}

Status AppRegistry::setLicenceData(std::string_view bundleIdentifier, ByteView licence) {
  Database::Session session(database_);
  Status set =
      session.run("update bundles set licence = ? where app = (select position from apps where identifier = ?)",
                  licence, bundleIdentifier);
  if (!set) return asSystemError(set.error());
  if (session.changes() > 0) return {};
  return installerError(InstallerFailure::unknownApp,
                        "there is no app \"" + std::string(bundleIdentifier) + "\" to give a licence to");
}

Result<std::optional<Bytes>> AppRegistry::licenceData(std::string_view bundleIdentifier) {
  Database::Session session(database_);
  return app_table::licenceOf(session, bundleIdentifier);
}

}  // namespace appsync::device
