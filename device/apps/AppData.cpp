#include "device/apps/AppData.h"

#include <cerrno>
#include <utility>
#include <vector>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/packages/BundleIdentifier.h"
#include "device/storage/FileTree.h"
#include "device/storage/RandomNames.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

using platform::IntermediateDirectories;

std::string dataContainerOf(std::string_view identifier) {
  return std::string(kDataPath) + '/' + std::string(identifier);
}

namespace app_data {

namespace {

std::string keptPathOf(std::string_view identifier) {
  return std::string(kRestoreDataPath) + '/' + std::string(identifier);
}

Result<FileDescriptor> openFolder(DeviceFileSystem& files, std::string_view path) {
  RETURN_IF_ERROR(files.createDirectory(path, IntermediateDirectories::create, {}));
  return files.root().open(path, O_RDONLY | O_DIRECTORY);
}

Status removeIfThere(DeviceFileSystem& files, const std::string& path) {
  Status removed = files.removeItem(path);
  if (!removed && removed.error().code == ENOENT) return {};
  return removed;
}

/// Replaces an item by one that is complete. The work directory receives the old one.
int moveInto(int from, const char* name, int folder, const char* place, int work) {
  const int removed = tree::remove(folder, place, work);
  if (removed != 0 && removed != ENOENT) return removed;
  return sys::rename(from, name, folder, place, sys::Replace::no);
}

Status copyToKept(DeviceFileSystem& files, const std::string& identifier, const std::string& hostFolder,
                  std::uint64_t& bytes) {
  const FileDescriptor source(::open(hostFolder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!source.valid()) return Error::fromErrno(errno, hostFolder);
  const Result<FileDescriptor> kept = openFolder(files, kRestoreDataPath);
  if (!kept) return kept.error();
  const std::string draft = temporaryName();
  int error = tree::copy(source.get(), ".", files.work(), draft.c_str(), bytes);
  if (error == 0) error = sys::syncFileSystem(kept->get());
  if (error == 0) error = moveInto(files.work(), draft.c_str(), kept->get(), identifier.c_str(), files.work());
  if (error == 0) return {};
  static_cast<void>(tree::remove(files.work(), draft.c_str(), files.work()));
  return Error::fromErrno(error, "the data of " + identifier);
}

Result<std::vector<std::string>> identifiersIn(Database& database, const char* query) {
  std::vector<std::string> identifiers;
  Database::Session session(database);
  Statement row = session.prepare(query);
  while (row.next())
    identifiers.emplace_back(row.text(0));
  if (!row.status()) return row.status().error();
  return identifiers;
}

}  // namespace

Status keep(DeviceFileSystem& files, Database& database, std::string_view identifier, const std::string& hostFolder) {
  const std::string name(identifier);
  if (!isBundleIdentifier(name)) return Error::fromErrno(EINVAL, "\"" + name + "\" is not a bundle identifier");
  {
    // A crash must not leave the record of the old data with the new data.
    Database::Session session(database);
    RETURN_IF_ERROR(deleteRestoreRecord(session, identifier));
  }
  std::uint64_t bytes = 0;
  RETURN_IF_ERROR(copyToKept(files, name, hostFolder, bytes));
  Database::Transaction transaction(database, Durability::power);
  transaction.run("insert or replace into restore_data values (?, ?)", identifier, bytes).ignore();
  return transaction.commit();
}

Result<bool> isKept(Database::Session& session, std::string_view identifier, std::uint64_t* size) {
  Statement row = session.prepare("select size from restore_data where identifier = ?", identifier);
  const bool found = row.next();
  if (!row.status()) return row.status().error();
  if (found && size != nullptr) *size = static_cast<std::uint64_t>(row.integer(0));
  return found;
}

Status drop(DeviceFileSystem& files, Database& database, std::string_view identifier) {
  {
    Database::Session session(database);
    RETURN_IF_ERROR(deleteRestoreRecord(session, identifier));
  }
  return isBundleIdentifier(identifier) ? removeIfThere(files, keptPathOf(identifier)) : Status();
}

Status commitRestoreData(DeviceFileSystem& files, Database& database, std::string_view identifier) {
  {
    Database::Session session(database);
    const Result<bool> kept = isKept(session, identifier, nullptr);
    if (!kept) return kept.error();
    if (!*kept) return {};
  }
  // Moved by an earlier attempt.
  if (!files.fileExists(keptPathOf(identifier))) return {};
  const Result<FileDescriptor> from = openFolder(files, kRestoreDataPath);
  if (!from) return from.error();
  const Result<FileDescriptor> data = openFolder(files, kDataPath);
  if (!data) return data.error();
  const std::string name(identifier);
  const int error = moveInto(from->get(), name.c_str(), data->get(), name.c_str(), files.work());
  if (error != 0) return Error::fromErrno(error, "the data of " + name);
  return {};
}

Status deleteRestoreRecord(Database::Session& session, std::string_view identifier) {
  return session.run("delete from restore_data where identifier = ?", identifier);
}

Status markRemoved(Database::Session& session, std::string_view identifier) {
  RETURN_IF_ERROR(deleteRestoreRecord(session, identifier));
  return session.run("insert or ignore into removed_data values (?)", identifier);
}

void sweepRemoved(DeviceFileSystem& files, Database& database, std::string_view identifier) {
  const Status data = removeIfThere(files, dataContainerOf(identifier));
  const Status kept = removeIfThere(files, keptPathOf(identifier));
  if (!data || !kept) return;
  Database::Session session(database);
  session.run("delete from removed_data where identifier = ?", identifier).ignore();
}

Status recover(DeviceFileSystem& files, Database& database) {
  const auto removed = identifiersIn(database, "select identifier from removed_data");
  if (!removed) return removed.error();
  for (const std::string& identifier : *removed)
    sweepRemoved(files, database, identifier);
  const Result<FileDescriptor> kept = files.root().open(kRestoreDataPath, O_RDONLY | O_DIRECTORY);
  if (!kept) return {};
  std::vector<std::string> strays;
  FolderEntries entries(kept->get());
  while (const char* name = entries.next()) {
    Database::Session session(database);
    const Result<bool> isOwned = isKept(session, name, nullptr);
    if (!isOwned) return isOwned.error();
    if (!*isOwned) strays.emplace_back(name);
  }
  for (const std::string& stray : strays) {
    const int error = tree::remove(kept->get(), stray.c_str(), files.work());
    if (error != 0) return Error::fromErrno(error, stray);
  }
  return {};
}

}  // namespace app_data

}  // namespace appsync::device
