#include "device/BackupManager.h"

#include "device/Database.h"

namespace appsync::device {

Status BackupManager::keepRestoreData(std::string_view bundleIdentifier, std::uint64_t size) {
  Database::Session session(database_);
  return session.run("insert or replace into restore_data values (?, ?)", bundleIdentifier, size);
}

bool BackupManager::restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) {
  Database::Session session(database_);
  Statement data = session.prepare("select size from restore_data where identifier = ?", bundleIdentifier);
  if (!data.next()) return false;
  if (size != nullptr) *size = static_cast<std::uint64_t>(data.integer(0));
  return true;
}

bool BackupManager::cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) {
  Database::Session session(database_);
  const Status dropped = session.run("delete from restore_data where identifier = ?", bundleIdentifier);
  if (!dropped) setError(error, dropped.error());
  return dropped.ok();
}

}  // namespace appsync::device
