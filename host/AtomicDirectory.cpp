#include "host/AtomicDirectory.h"

#include <cerrno>
#include <string_view>
#include <utility>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "base/ReturnIfError.h"
#include "device/storage/FileTree.h"
#include "device/storage/SystemCalls.h"

namespace appsync::host {
namespace {

namespace sys = device::sys;

Error refusal(int error, std::string text) {
  return {std::string(domains::kPOSIX), error, std::move(text), nullptr};
}

Error existsError(const std::string& path) {
  return refusal(EEXIST, path + " already exists; choose another name, or remove it");
}

/// Names in the hidden directory: a file that is created first and removed last, and the directory to publish.
constexpr const char* kMark = ".appsync-draft";
constexpr const char* kContent = "content";

/// Returns whether an existing hidden directory was left by a crash: it has the mark, or it is still empty.
Result<bool> isDraft(int hidden) {
  struct stat status {};
  if (fstatat(hidden, kMark, &status, AT_SYMLINK_NOFOLLOW) == 0) return true;
  device::FolderEntries entries(hidden);
  const bool isEmpty = entries.next() == nullptr;
  if (entries.failure() != 0) return Error::fromErrno(entries.failure());
  return isEmpty;
}

/// Removes everything except the mark, so that the directory stays recognizable after a crash.
int clear(int hidden) {
  device::FolderEntries entries(hidden);
  while (const char* name = entries.next()) {
    if (name == std::string_view(kMark)) continue;
    if (const int error = device::tree::remove(hidden, name, hidden); error != 0) return error;
  }
  return entries.failure();
}

int makeContent(int hidden, device::FileDescriptor& content) {
  int error = device::tree::create(hidden, kMark, {});
  if (error == EEXIST) error = clear(hidden);
  if (error == 0) error = sys::makeFolder(hidden, kContent);
  if (error != 0) return error;
  content = device::FileDescriptor(openat(hidden, kContent, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  return content.valid() ? 0 : errno;
}

}  // namespace

AtomicDirectory::AtomicDirectory(std::string path, const std::filesystem::path& place, device::FileDescriptor parent)
    : path_(std::move(path)),
      name_(place.filename().string()),
      hiddenName_("." + name_ + ".partial"),
      hiddenPath_((place.parent_path() / hiddenName_).string()),
      parent_(std::move(parent)) {}

Result<AtomicDirectory> AtomicDirectory::make(const std::string& path) {
  std::filesystem::path place = std::filesystem::path(path).lexically_normal();
  if (place.filename().empty()) place = place.parent_path();
  const std::string name = place.filename().string();
  if (name.empty() || name == "." || name == "..") return existsError(path);
  const std::string parentPath = place.has_parent_path() ? place.parent_path().string() : ".";
  device::FileDescriptor parent(::open(parentPath.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!parent.valid()) return Error::fromErrno(errno, parentPath + ", the parent directory of " + name);
  struct stat status {};
  if (fstatat(parent.get(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) return existsError(path);
  AtomicDirectory directory(path, place, std::move(parent));
  RETURN_IF_ERROR(directory.open());
  return directory;
}

Result<bool> AtomicDirectory::lockHidden() {
  const int made = sys::makeFolder(parent_.get(), hiddenName_.c_str());
  if (made != 0 && made != EEXIST) return Error::fromErrno(made, path_);
  device::FileDescriptor hidden(
      openat(parent_.get(), hiddenName_.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!hidden.valid() && errno == ENOENT) return false;
  if (!hidden.valid()) return Error::fromErrno(errno, hiddenPath_);
  if (flock(hidden.get(), LOCK_EX | LOCK_NB) != 0) {
    return refusal(errno, path_ + " is being created by another process; wait until that process has ended");
  }
  // The previous holder may have removed it between the open and the lock.
  struct stat locked {};
  struct stat named {};
  if (fstat(hidden.get(), &locked) != 0) return Error::fromErrno(errno, hiddenPath_);
  const bool isThere = fstatat(parent_.get(), hiddenName_.c_str(), &named, AT_SYMLINK_NOFOLLOW) == 0;
  if (!isThere || locked.st_dev != named.st_dev || locked.st_ino != named.st_ino) return false;
  const Result<bool> isOurs = isDraft(hidden.get());
  if (!isOurs) return isOurs.error().in(hiddenPath_);
  if (!*isOurs) {
    return refusal(EEXIST, hiddenPath_ +
                               " already exists and is not an unfinished backup; move it away, or choose "
                               "another name");
  }
  hidden_ = std::move(hidden);
  return true;
}

Status AtomicDirectory::open() {
  for (bool isLocked = false; !isLocked;) {
    const Result<bool> locked = lockHidden();
    if (!locked) return locked.error();
    isLocked = *locked;
  }
  const int error = makeContent(hidden_.get(), folder_);
  return error == 0 ? Status() : Status(Error::fromErrno(error, path_));
}

AtomicDirectory::~AtomicDirectory() {
  if (!hidden_.valid()) return;
  if (clear(hidden_.get()) != 0) return;
  static_cast<void>(sys::removeFile(hidden_.get(), kMark));
  static_cast<void>(sys::removeEmptyFolder(parent_.get(), hiddenName_.c_str()));
}

std::string AtomicDirectory::folderPath() const {
  return hiddenPath_ + "/" + kContent;
}

Status AtomicDirectory::publish() {
  int error = sys::syncFileSystem(folder_.get());
  if (error == 0) error = sys::rename(hidden_.get(), kContent, parent_.get(), name_.c_str(), sys::Replace::no);
  if (error == EEXIST) return existsError(path_);
  if (error != 0) return Error::fromErrno(error, path_);
  error = sys::syncFileSystem(parent_.get());
  return error == 0 ? Status() : Status(Error::fromErrno(error, path_));
}

}  // namespace appsync::host
