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

/// What there is before the database has its name.
constexpr std::array<std::string_view, 7> kBeginnings = {kLockFile,
                                                         kRootFolder,
                                                         kWorkFolder,
                                                         kNewDatabaseFile,
                                                         "device.db.new-wal",
                                                         "device.db.new-shm",
                                                         "device.db.new-journal"};

/// Folders that other components of a device expect, and that it is whole without.
constexpr std::array<std::string_view, 4> kDeviceFolders = {
    DeviceFileSystem::kTemporaryDirectory, "/var/mobile/Library/Logs/MediaServices", "/var/mobile/Library/Preferences",
    "/var/mobile/Media/PublicStaging"};

/// The process that says in the lock file that it holds the device; empty when it says nothing.
std::string holder(int lock) {
  char text[32];
  const ssize_t length = pread(lock, text, sizeof text, 0);
  const std::string_view number(text, length < 0 ? 0 : static_cast<std::size_t>(length));
  return std::string(number.substr(0, number.find('\n')));
}

Status writeHolder(int lock) {
  const std::string number = std::to_string(getpid()) + "\n";
  const int failed = ftruncate(lock, 0) != 0 ? errno : sys::writeAt(lock, bytesOf(number), 0);
  if (failed != 0) return Error::fromErrno(failed, kLockFile);
  return {};
}

Status makeIfMissing(int folder, const char* name) {
  const int number = sys::makeFolder(folder, name);
  if (number != 0 && number != EEXIST) return Error::fromErrno(number, name);
  return {};
}

/// Making it anew would be losing what lay in it: it may be elsewhere for a while only.
Error missingFolder(const std::string& path, const std::string& name) {
  return deviceError(DeviceFailure::damaged, path + ": the device is damaged (it has no folder \"" + name +
                                                 "\"); mount what belongs there, or put a copy of the device in its "
                                                 "place");
}

/// Whatever lies in the root.
Result<DeviceFileSystem> filesIn(const std::string& path, int folder, Access access) {
  Result<RootFolder> root = RootFolder::open(path + '/' + kRootFolder);
  if (!root && root.error().code == ENOENT) return missingFolder(path, kRootFolder);
  if (!root) return root.error();
  FileDescriptor work;
  if (access == Access::exclusive) {
    RETURN_IF_ERROR(makeIfMissing(folder, kWorkFolder));
    work = FileDescriptor(openat(folder, kWorkFolder, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!work.valid()) return Error::fromErrno(errno, kWorkFolder);
  }
  return DeviceFileSystem(std::move(root).value(), std::move(work), access);
}

}  // namespace

Status checkFolderIsFree(const std::string& path, int folder) {
  struct stat status {};
  if (fstatat(folder, kDatabaseFile, &status, AT_SYMLINK_NOFOLLOW) == 0) {
    return deviceError(DeviceFailure::exists, path + " is a device already; use it as it is, or choose another folder");
  }
  bool isEmpty = true;
  bool wasBegun = false;
  bool hasMore = false;
  FolderEntries entries(folder);
  while (const char* name = entries.next()) {
    isEmpty = false;
    wasBegun |= name == std::string_view(kLockFile);
    hasMore |= std::ranges::find(kBeginnings, name) == kBeginnings.end();
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
    const std::string number = holder(lock.get());
    return deviceError(DeviceFailure::held, path + " is held by another process" +
                                                (number.empty() ? "" : " (pid " + number + ")") +
                                                "; wait until it has ended and try again");
  }
  RETURN_IF_ERROR(writeHolder(lock.get()));
  return lock;
}

Status makeDeviceFolders(const std::string& path, int folder) {
  RETURN_IF_ERROR(makeIfMissing(folder, kRootFolder));
  Result<DeviceFileSystem> files = filesIn(path, folder, Access::exclusive);
  return files ? files->createDirectory(kContainersPath, platform::IntermediateDirectories::create, {}) : files.error();
}

Result<DeviceFileSystem> openFileSystem(const std::string& path, int folder, Access access) {
  Result<DeviceFileSystem> files = filesIn(path, folder, access);
  if (!files) return files;
  const Result<FileDescriptor> containers = files->root().open(kContainersPath, O_PATH | O_DIRECTORY);
  if (!containers && containers.error().code == ENOENT) {
    return missingFolder(path, kRootFolder + std::string(kContainersPath));
  }
  if (!containers) return containers.error();
  if (access == Access::readOnly) return files;
  for (const std::string_view name : kDeviceFolders) {
    const Status made = files->createDirectory(name, platform::IntermediateDirectories::create, {});
    if (!made) return made.error();
  }
  return files;
}

}  // namespace appsync::device
