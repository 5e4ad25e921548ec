#include "device/DeviceLayout.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string_view>
#include <utility>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include "base/ReturnIfError.h"
#include "device/DeviceError.h"
#include "device/apps/AppRecord.h"
#include "device/storage/FileTree.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

namespace {

/// The files of a device whose creation was interrupted.
constexpr std::array<std::string_view, 7> kIncompleteDeviceFiles = {
    kLockFile,           kRootDirectory,      kWorkDirectory,         kNewDatabaseFile,
    "device.db.new-wal", "device.db.new-shm", "device.db.new-journal"};

/// Optional directories, created when the device is opened.
constexpr std::array<std::string_view, 4> kDeviceDirectories = {
    DeviceFileSystem::kTemporaryDirectory, "/var/mobile/Library/Logs/MediaServices", "/var/mobile/Library/Preferences",
    "/var/mobile/Media/PublicStaging"};

/// Returns the process id in the lock file, or an empty string.
std::string holder(int lock) {
  char text[32];
  const ssize_t length = pread(lock, text, sizeof text, 0);
  const std::string_view pid(text, length < 0 ? 0 : static_cast<std::size_t>(length));
  return std::string(pid.substr(0, pid.find('\n')));
}

Status writeHolder(int lock) {
  const std::string pid = std::to_string(getpid()) + "\n";
  const int error = ftruncate(lock, 0) != 0 ? errno : sys::writeAt(lock, bytesOf(pid), 0);
  if (error != 0) return Error::fromErrno(error, kLockFile);
  return {};
}

Status makeIfMissing(int folder, const char* name) {
  const int error = sys::makeFolder(folder, name);
  if (error != 0 && error != EEXIST) return Error::fromErrno(error, name);
  return {};
}

/// Not recreated: the directory may be a mount point whose file system is not mounted.
Error missingDirectory(const std::string& path, const std::string& name) {
  return deviceError(DeviceFailure::damaged, path + ": the device is damaged (it has no folder \"" + name +
                                                 "\"); mount what belongs there, or put a copy of the device in its "
                                                 "place");
}

/// Opens the file system without checking the content of the root.
Result<DeviceFileSystem> filesIn(const std::string& path, int folder, Access access) {
  Result<RootDirectory> root = RootDirectory::open(path + '/' + kRootDirectory);
  if (!root && root.error().code == ENOENT) return missingDirectory(path, kRootDirectory);
  if (!root) return root.error();
  FileDescriptor work;
  if (access == Access::exclusive) {
    RETURN_IF_ERROR(makeIfMissing(folder, kWorkDirectory));
    work = FileDescriptor(openat(folder, kWorkDirectory, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!work.valid()) return Error::fromErrno(errno, kWorkDirectory);
  }
  return DeviceFileSystem(std::move(root).value(), std::move(work), access);
}

}  // namespace

Status checkDirectoryIsFree(const std::string& path, int folder) {
  struct stat status {};
  if (fstatat(folder, kDatabaseFile, &status, AT_SYMLINK_NOFOLLOW) == 0) {
    return deviceError(DeviceFailure::exists, path + " is already a device; use it, or choose another folder");
  }
  bool isEmpty = true;
  bool wasBegun = false;
  bool hasMore = false;
  FolderEntries entries(folder);
  while (const char* name = entries.next()) {
    isEmpty = false;
    wasBegun |= name == std::string_view(kLockFile);
    hasMore |= std::ranges::find(kIncompleteDeviceFiles, name) == kIncompleteDeviceFiles.end();
  }
  if (entries.failure() != 0) return Error::fromErrno(entries.failure(), path);
  if (isEmpty || (wasBegun && !hasMore)) return {};
  return deviceError(DeviceFailure::exists,
                     path + " is not empty; choose an empty folder, or one that does not exist yet");
}

Result<FileDescriptor> lockDevice(const std::string& path, int folder) {
  FileDescriptor lock(openat(folder, kLockFile, O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, sys::kFileMode));
  if (!lock.valid()) return Error::fromErrno(errno, kLockFile);
  if (flock(lock.get(), LOCK_EX | LOCK_NB) != 0) {
    if (errno != EWOULDBLOCK) return Error::fromErrno(errno, kLockFile);
    const std::string pid = holder(lock.get());
    return deviceError(DeviceFailure::held, path + " is held by another process" +
                                                (pid.empty() ? "" : " (pid " + pid + ")") +
                                                "; wait until it has ended and try again");
  }
  RETURN_IF_ERROR(writeHolder(lock.get()));
  return lock;
}

Status makeDeviceDirectories(const std::string& path, int folder) {
  RETURN_IF_ERROR(makeIfMissing(folder, kRootDirectory));
  Result<DeviceFileSystem> files = filesIn(path, folder, Access::exclusive);
  return files ? files->createDirectory(kContainersPath, platform::IntermediateDirectories::create, {}) : files.error();
}

Result<DeviceFileSystem> openFileSystem(const std::string& path, int folder, Access access) {
  Result<DeviceFileSystem> files = filesIn(path, folder, access);
  if (!files) return files;
  const Result<FileDescriptor> containers = files->root().open(kContainersPath, O_PATH | O_DIRECTORY);
  if (!containers && containers.error().code == ENOENT) {
    return missingDirectory(path, kRootDirectory + std::string(kContainersPath));
  }
  if (!containers) return containers.error();
  if (access == Access::readOnly) return files;
  for (const std::string_view name : kDeviceDirectories) {
    RETURN_IF_ERROR(files->createDirectory(name, platform::IntermediateDirectories::create, {}));
  }
  return files;
}

}  // namespace appsync::device
