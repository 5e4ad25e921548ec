#include "device/storage/SystemCalls.h"

#include <cerrno>

#include <fcntl.h>

#include "device/storage/FaultPoint.h"

namespace appsync::device::sys {

namespace {

/// Makes a system call, which returns -1 on failure, unless a fault is injected.
template <class Call>
int perform(const char* name, Call call) {
  if (const int injected = faultPoint(name); injected != 0) return injected;
  for (;;) {
    if (call() != -1) return 0;
    if (errno != EINTR) return errno;
  }
}

/// For file systems without RENAME_NOREPLACE. Not atomic.
int renameUnlessThere(int fromFolder, const char* from, int toFolder, const char* to) {
  struct stat there {};
  if (fstatat(toFolder, to, &there, AT_SYMLINK_NOFOLLOW) == 0) return EEXIST;
  return renameat(fromFolder, from, toFolder, to) == 0 ? 0 : errno;
}

}  // namespace

int makeFolder(int folder, const char* name) {
  return perform("make folder", [&] { return mkdirat(folder, name, kFolderMode); });
}

int createFile(int folder, const char* name, mode_t mode, FileDescriptor& file) {
  return perform("create file", [&] {
    file = FileDescriptor(openat(folder, name, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, mode));
    return file.get();
  });
}

int writeAt(int file, ByteView bytes, std::int64_t offset) {
  while (!bytes.empty()) {
    ssize_t written = 0;
    const int error = perform("write", [&] {
      written = pwrite(file, bytes.data(), bytes.size(), offset);
      return written < 0 ? -1 : 0;
    });
    if (error != 0) return error;
    if (written == 0) return ENOSPC;
    bytes = bytes.subspan(static_cast<std::size_t>(written));
    offset += written;
  }
  return 0;
}

int makeLink(const char* target, int folder, const char* name) {
  return perform("make link", [&] { return symlinkat(target, folder, name); });
}

int rename(int fromFolder, const char* from, int toFolder, const char* to, Replace replace) {
  if (replace == Replace::yes) {
    return perform("rename", [&] { return renameat(fromFolder, from, toFolder, to); });
  }
  const int error = perform("rename", [&] { return renameat2(fromFolder, from, toFolder, to, RENAME_NOREPLACE); });
  return error == EINVAL || error == ENOSYS ? renameUnlessThere(fromFolder, from, toFolder, to) : error;
}

int removeFile(int folder, const char* name) {
  return perform("remove file", [&] { return unlinkat(folder, name, 0); });
}

int removeEmptyFolder(int folder, const char* name) {
  return perform("remove folder", [&] { return unlinkat(folder, name, AT_REMOVEDIR); });
}

int writeOut(int file) {
  // The rename is journaled after the content is written, and the journal's commit flushes the disk's cache first. This
  // keeps the order without waiting for a commit, which takes up to fifty times as long while packages are unpacked.
  constexpr unsigned kAll = SYNC_FILE_RANGE_WAIT_BEFORE | SYNC_FILE_RANGE_WRITE | SYNC_FILE_RANGE_WAIT_AFTER;
  const int error = perform("write out", [&] { return sync_file_range(file, 0, 0, kAll); });
  if (error != ENOSYS && error != EINVAL && error != EOPNOTSUPP) return error;
  return perform("write out", [&] { return fdatasync(file); });
}

int syncFileSystem(int file) {
  return perform("sync", [&] { return syncfs(file); });
}

int touch(int file) {
  return perform("touch", [&] { return futimens(file, nullptr); });
}

int setAttributes(int file, mode_t mode, const struct stat& status) {
  const timespec times[] = {status.st_atim, status.st_mtim};
  const int error = perform("set attributes", [&] { return fchmod(file, mode) == 0 ? futimens(file, times) : -1; });
  return error == EPERM || error == EOPNOTSUPP ? 0 : error;
}

int copyContents(int from, int to, std::uint64_t& bytes) {
  constexpr std::size_t kMost = std::size_t{1} << 30;
  for (;;) {
    ssize_t copied = 0;
    const int error = perform("copy", [&] {
      copied = copy_file_range(from, nullptr, to, nullptr, kMost, 0);
      return copied < 0 ? -1 : 0;
    });
    if (error == 0 && copied == 0) return 0;
    if (error == 0) {
      bytes += static_cast<std::uint64_t>(copied);
      continue;
    }
    if (error != EXDEV && error != ENOSYS && error != EINVAL && error != EOPNOTSUPP) return error;
    // copy_file_range does not support these file systems: copy the rest with read and write.
    Bytes buffer(std::size_t{1} << 17);
    const ssize_t got = read(from, buffer.data(), buffer.size());
    if (got < 0 && errno != EINTR) return errno;
    if (got == 0) return 0;
    if (got < 0) continue;
    const auto end = lseek(to, 0, SEEK_END);
    if (end < 0) return errno;
    const auto size = static_cast<std::size_t>(got);
    if (const int unwritten = writeAt(to, ByteView(buffer).first(size), end); unwritten != 0) return unwritten;
    bytes += size;
  }
}

}  // namespace appsync::device::sys
