#include "device/Device.h"

#include <cerrno>
#include <cstdint>
#include <initializer_list>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>

#include "base/ReturnIfError.h"
#include "device/DeviceLayout.h"
#include "device/Recovery.h"
#include "device/apps/AppTable.h"
#include "device/storage/FaultPoint.h"
#include "device/storage/HostFile.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

namespace {

/// Marks the database file as a device's: "ASDV".
constexpr std::int64_t kApplicationId = 0x41534456;
/// The version of the tables and of the files in the root. Incremented with each incompatible change.
constexpr std::int64_t kLayoutVersion = 1;

Result<std::int64_t> readNumber(Database& database, std::string_view question) {
  Database::Session session(database);
  Statement query = session.prepare(question);
  if (query.next()) return query.integer(0);
  return query.status() ? std::int64_t{0} : Result<std::int64_t>(query.status().error());
}

/// Creates missing tables. Devices of earlier releases with this layout lack the newer ones.
void makeTables(Database::Transaction& transaction) {
  for (const char* schema : Services::kSchemas)
    transaction.runScript(schema).ignore();
}

Status makeMissingTables(Database& database) {
  Database::Transaction transaction(database);
  makeTables(transaction);
  return transaction.commit();
}

/// Removes the existing files of an incomplete database.
Status removeNewDatabase(int folder, std::initializer_list<std::string_view> endings) {
  for (const std::string_view ending : endings) {
    const int error = sys::removeFile(folder, (kNewDatabaseFile + std::string(ending)).c_str());
    if (error != 0 && error != ENOENT) return Error::fromErrno(error, kNewDatabaseFile);
  }
  return {};
}

/// Creates the database under its temporary name, without a separate log, so that one rename publishes it.
Status fillNewDatabase(const std::string& path, InstallMode mode) {
  const Result<std::unique_ptr<Database>> database = Database::open(path + '/' + kNewDatabaseFile, Access::exclusive);
  if (!database) return database.error();
  {
    Database::Transaction transaction(**database);
    makeTables(transaction);
    if (mode == InstallMode::coordinated) {
      transaction.run("insert into settings values ('coordination', '', 'on')").ignore();
    }
    transaction.runScript(("pragma application_id = " + std::to_string(kApplicationId)).c_str()).ignore();
    transaction.runScript(("pragma user_version = " + std::to_string(kLayoutVersion)).c_str()).ignore();
    RETURN_IF_ERROR(transaction.commit());
  }
  Database::Session session(**database);
  return session.runScript("pragma journal_mode = delete");
}

/// Creates the database. Its rename makes the directory a device.
Status makeDatabase(const std::string& path, int folder, InstallMode mode) {
  RETURN_IF_ERROR(removeNewDatabase(folder, {"", "-journal", "-wal", "-shm"}));
  RETURN_IF_ERROR(fillNewDatabase(path, mode));
  // Closing the database keeps its log, although the journal mode has changed.
  RETURN_IF_ERROR(removeNewDatabase(folder, {"-wal", "-shm"}));
  // A device whose directories are lost in a power failure would be damaged.
  int error = sys::syncFileSystem(folder);
  if (error == 0) error = sys::rename(folder, kNewDatabaseFile, folder, kDatabaseFile, sys::Replace::no);
  if (error != 0) return Error::fromErrno(error, kDatabaseFile);
  return {};
}

/// Checks that the tables of apps exist. Every version of this layout has them; creating them would lose all apps.
Status checkRegister(Database& database) {
  Database::Session session(database);
  const auto found = app_table::find(session, {});
  return found ? Status() : Status(found.error());
}

Status checkDatabase(const std::string& path, Database& database) {
  const Result<std::int64_t> application = readNumber(database, "pragma application_id");
  if (!application) return application.error();
  if (*application != kApplicationId) {
    return deviceError(DeviceFailure::notADevice,
                       path + " is not a device: its device.db belongs to another program; name a device's folder");
  }
  const Result<std::int64_t> version = readNumber(database, "pragma user_version");
  if (!version) return version.error();
  if (*version != kLayoutVersion) {
    return deviceError(DeviceFailure::otherVersion,
                       path + " was made by " + (*version > kLayoutVersion ? "a newer" : "an older") +
                           " version of appsync (layout " + std::to_string(*version) + ", this one has " +
                           std::to_string(kLayoutVersion) + "); use that version");
  }
  Database::Session session(database);
  Statement check = session.prepare("pragma quick_check(1)");
  if (check.next() && check.text(0) == "ok") return {};
  if (!check.status()) return check.status();
  return deviceError(DeviceFailure::damaged,
                     path + ": the device is damaged (" + std::string(check.text(0)) +
                         "); put a copy of it in its place, or make a new one with \"appsync init\"");
}

Status checkIsDevice(const std::string& path, int folder) {
  struct stat status {};
  if (fstatat(folder, kDatabaseFile, &status, 0) == 0) return {};
  if (errno != ENOENT) return Error::fromErrno(errno, kDatabaseFile);
  return deviceError(
      DeviceFailure::notADevice,
      path + " is not a device: it has no device.db; name a device's folder, or make one with \"appsync init\"");
}

Result<FileDescriptor> openFolder(const std::string& path) {
  FileDescriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!folder.valid()) return Error::fromErrno(errno, path);
  return folder;
}

Result<FileDescriptor> makeDevice(const std::string& path, InstallMode mode) {
  const int made = sys::makeFolder(AT_FDCWD, path.c_str());
  if (made == ENOENT) {
    return deviceError(DeviceFailure::missing,
                       path + " cannot be created: its parent folder is missing; create that first");
  }
  if (made != 0 && made != EEXIST) return Error::fromErrno(made, path);
  const Result<FileDescriptor> folder = openFolder(path);
  if (!folder) return folder.error();
  RETURN_IF_ERROR(checkDirectoryIsFree(path, folder->get()));
  Result<FileDescriptor> lock = lockDevice(path, folder->get());
  if (!lock) return lock.error();
  RETURN_IF_ERROR(makeDeviceDirectories(path, folder->get()));
  RETURN_IF_ERROR(makeDatabase(path, folder->get(), mode));
  return lock;
}

}  // namespace

Device::Device(std::string path, FileDescriptor lock, std::unique_ptr<Database> database, DeviceFileSystem files,
               Access access)
    : path_(std::move(path)),
      lock_(std::move(lock)),
      database_(std::move(database)),
      files_(std::move(files)),
      services_(*database_, files_, access) {}

Result<std::unique_ptr<Device>> Device::create(const std::string& path, InstallMode mode) {
  installKillHookFromEnvironment();
  Result<FileDescriptor> lock = makeDevice(path, mode);
  if (!lock) return deviceError(path, Access::exclusive, lock.error());
  return open(path, Access::exclusive, std::move(lock).value());
}

Result<std::unique_ptr<Device>> Device::open(const std::string& path, Access access) {
  installKillHookFromEnvironment();
  const auto locked = [&]() -> Result<FileDescriptor> {
    const Result<FileDescriptor> folder = openFolder(path);
    if (!folder) return folder.error();
    RETURN_IF_ERROR(checkIsDevice(path, folder->get()));
    return access == Access::readOnly ? FileDescriptor() : lockDevice(path, folder->get());
  };
  Result<FileDescriptor> lock = locked();
  if (!lock) return deviceError(path, access, lock.error());
  return open(path, access, std::move(lock).value());
}

Result<std::unique_ptr<Device>> Device::open(const std::string& path, Access access, FileDescriptor lock) {
  Result<std::unique_ptr<Database>> database = Database::open(path + '/' + kDatabaseFile, access);
  if (!database) return deviceError(path, access, database.error());
  const auto prepared = [&]() -> Result<DeviceFileSystem> {
    RETURN_IF_ERROR(checkDatabase(path, **database));
    RETURN_IF_ERROR(checkRegister(**database));
    const Result<FileDescriptor> folder = openFolder(path);
    if (!folder) return folder.error();
    Result<DeviceFileSystem> files = openFileSystem(path, folder->get(), access);
    if (!files || access == Access::readOnly) return files;
    removeHostFileDrafts(folder->get());
    Settings settings(**database);
    RETURN_IF_ERROR(makeMissingTables(**database));
    RETURN_IF_ERROR(recover(**database, *files, settings));
    return files;
  };
  Result<DeviceFileSystem> files = prepared();
  if (!files) return deviceError(path, access, files.error());
  return std::unique_ptr<Device>(
      new Device(path, std::move(lock), std::move(database).value(), std::move(files).value(), access));
}

}  // namespace appsync::device
