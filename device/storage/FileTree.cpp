#include "device/storage/FileTree.h"

#include <cerrno>
#include <cstring>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <limits.h>
#include <sys/stat.h>

#include "device/storage/RandomNames.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

FolderEntries::FolderEntries(int folder) {
  FileDescriptor own(openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (own.valid()) stream_.reset(fdopendir(own.get()));
  if (stream_ == nullptr) {
    failure_ = errno;
  } else {
    static_cast<void>(own.release());  // The stream owns it.
  }
}

const char* FolderEntries::next() {
  while (stream_ != nullptr) {
    errno = 0;
    const dirent* entry = readdir(stream_.get());
    if (entry == nullptr) {
      failure_ = errno;
      return nullptr;
    }
    if (std::strcmp(entry->d_name, ".") != 0 && std::strcmp(entry->d_name, "..") != 0) return entry->d_name;
  }
  return nullptr;
}

namespace tree {

namespace {

int copyFolder(int from, const struct stat& status, int toFolder, const char* to, std::uint64_t& bytes,
               std::uint64_t* leftOut) {
  if (const int error = sys::makeFolder(toFolder, to); error != 0) return error;
  const FileDescriptor made(openat(toFolder, to, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!made.valid()) return errno;
  FolderEntries entries(from);
  while (const char* name = entries.next()) {
    if (const int error = copy(from, name, made.get(), name, bytes, leftOut); error != 0) return error;
  }
  if (entries.failure() != 0) return entries.failure();
  // Without S_IRWXU the copy could be neither moved nor removed.
  return sys::setAttributes(made.get(), (status.st_mode & 0777) | S_IRWXU, status);
}

int copyFile(int from, const struct stat& status, int toFolder, const char* to, std::uint64_t& bytes) {
  const mode_t mode = status.st_mode & 0777;
  FileDescriptor made;
  if (const int error = sys::createFile(toFolder, to, mode, made); error != 0) return error;
  if (const int error = sys::copyContents(from, made.get(), bytes); error != 0) return error;
  return sys::setAttributes(made.get(), mode, status);
}

int copyLink(int fromFolder, const char* from, int toFolder, const char* to) {
  char target[PATH_MAX];
  const ssize_t length = readlinkat(fromFolder, from, target, sizeof target - 1);
  if (length < 0) return errno;
  target[length] = '\0';
  return sys::makeLink(target, toFolder, to);
}

/// Empties a directory: removes its files, moves its subdirectories to `work` and appends them to `pending`. Needs one
/// open directory whatever the depth of the tree.
int flatten(int folder, int work, std::vector<std::string>& pending) {
  FolderEntries entries(folder);
  while (const char* name = entries.next()) {
    int error = sys::removeFile(folder, name);
    if (error == EISDIR || error == EPERM) {  // unlink of a directory, depending on the file system.
      std::string moved = temporaryName();
      error = sys::rename(folder, name, work, moved.c_str(), sys::Replace::yes);
      if (error == 0) pending.push_back(std::move(moved));
    }
    if (error != 0) return error;
  }
  return entries.failure();
}

int removeFolder(int work, std::string name) {
  std::vector<std::string> pending{std::move(name)};
  while (!pending.empty()) {
    const std::string folder = std::move(pending.back());
    pending.pop_back();
    const FileDescriptor opened(openat(work, folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!opened.valid()) return errno;
    if (const int error = flatten(opened.get(), work, pending); error != 0) return error;
    if (const int error = sys::removeEmptyFolder(work, folder.c_str()); error != 0) return error;
  }
  return 0;
}

}  // namespace

int copy(int fromFolder, const char* from, int toFolder, const char* to, std::uint64_t& bytes, std::uint64_t* leftOut) {
  const auto leaveOut = [&] {
    if (leftOut != nullptr) ++*leftOut;
    return leftOut != nullptr ? 0 : EINVAL;
  };
  struct stat status {};
  // Without O_NONBLOCK opening a pipe would wait for a writer.
  const FileDescriptor source(openat(fromFolder, from, O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
  if (!source.valid() && errno == ELOOP) return copyLink(fromFolder, from, toFolder, to);
  if (!source.valid()) return errno == ENXIO ? leaveOut() : errno;  // A socket.
  if (fstat(source.get(), &status) != 0) return errno;
  if (S_ISDIR(status.st_mode)) return copyFolder(source.get(), status, toFolder, to, bytes, leftOut);
  if (S_ISREG(status.st_mode)) return copyFile(source.get(), status, toFolder, to, bytes);
  return leaveOut();
}

int create(int folder, const char* name, ByteView bytes) {
  FileDescriptor file;
  if (const int error = sys::createFile(folder, name, sys::kFileMode, file); error != 0) return error;
  const int error = sys::writeAt(file.get(), bytes, 0);
  if (error != 0) unlinkat(folder, name, 0);
  return error;
}

int remove(int folder, const char* name, int work) {
  std::string moved = temporaryName();
  if (const int error = sys::rename(folder, name, work, moved.c_str(), sys::Replace::yes); error != 0) return error;
  const int error = sys::removeFile(work, moved.c_str());
  return error == EISDIR || error == EPERM ? removeFolder(work, std::move(moved)) : error;
}

int empty(int folder, int work) {
  FolderEntries entries(folder);
  while (const char* name = entries.next()) {
    if (const int error = remove(folder, name, work); error != 0) return error;
  }
  return entries.failure();
}

int read(int file, std::uint64_t most, Bytes& bytes) {
  struct stat status {};
  if (fstat(file, &status) != 0) return errno;
  if (S_ISDIR(status.st_mode)) return EISDIR;
  if (!S_ISREG(status.st_mode)) return EINVAL;
  const auto expected = static_cast<std::uint64_t>(status.st_size);
  if (expected > most) return EFBIG;
  bytes.resize(expected);
  std::size_t length = 0;
  while (length < bytes.size()) {
    const ssize_t got = ::read(file, bytes.data() + length, bytes.size() - length);
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) return errno;
    if (got == 0) break;  // The file was truncated while it was read.
    length += static_cast<std::size_t>(got);
  }
  bytes.resize(length);
  return 0;
}

}  // namespace tree

}  // namespace appsync::device
