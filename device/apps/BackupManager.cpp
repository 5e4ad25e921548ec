#include "device/apps/BackupManager.h"

#include "base/ReturnIfError.h"

namespace appsync::device {

Status BackupManager::keepRestoreData(std::string_view bundleIdentifier, const std::string& hostFolder) {
  return app_data::keep(files_, database_, bundleIdentifier, hostFolder);
}

Status BackupManager::restoreDataNow(std::string_view bundleIdentifier) {
  RETURN_IF_ERROR(app_data::commitRestoreData(files_, database_, bundleIdentifier));
  Database::Session session(database_);
  return app_data::deleteRestoreRecord(session, bundleIdentifier);
}

bool BackupManager::restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) {
  Database::Session session(database_);
  const Result<bool> kept = app_data::isKept(session, bundleIdentifier, size);
  return kept && *kept;
}

bool BackupManager::cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) {
  const Status status = app_data::drop(files_, database_, bundleIdentifier);
  if (!status) setError(error, status.error());
  return status.ok();
}

}  // namespace appsync::device
