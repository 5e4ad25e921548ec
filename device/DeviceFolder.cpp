#include "device/DeviceFolder.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string_view>
#include <utility>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include "device/AppRecord.h"
#include "device/DeviceError.h"
#include "device/FileTree.h"
#include "device/SystemCalls.h"

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

/// Folders that other components of a device expect.
constexpr std::array<std::string_view, 5> kDeviceFolders = {
    kContainersPath, DeviceFileSystem::kTemporaryDirectory, "/var/mobile/Library/Logs/MediaServices",
    "/var/mobile/Library/Preferences", "/var/mobile/Media/PublicStaging"};

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
  if (Status written = writeHolder(lock.get()); !written) return written.error();
  return lock;
}

Status makeDeviceFolders(int folder) {
  for (const char* name : {kRootFolder, kWorkFolder}) {
    const int number = sys::makeFolder(folder, name);
    if (number != 0 && number != EEXIST) return Error::fromErrno(number, name);
  }
  return {};
}

Result<DeviceFileSystem> openFileSystem(const std::string& path, int folder, Access access) {
  Result<RootFolder> root = RootFolder::open(path + '/' + kRootFolder);
  if (!root && root.error().code == ENOENT) {
    return deviceError(DeviceFailure::damaged,
                       path + ": the device is damaged (it has no folder \"root\"); open it once for writing");
  }
  if (!root) return root.error();
  FileDescriptor work;
  if (access == Access::exclusive) {
    work = FileDescriptor(openat(folder, kWorkFolder, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!work.valid()) return Error::fromErrno(errno, kWorkFolder);
  }
  DeviceFileSystem files(std::move(root).value(), std::move(work), access);
  if (access == Access::readOnly) return files;
  for (const std::string_view name : kDeviceFolders) {
    const Status made = files.createDirectory(name, platform::IntermediateDirectories::create, {});
    if (!made) return made.error();
  }
  return files;
}

}  // namespace appsync::device
