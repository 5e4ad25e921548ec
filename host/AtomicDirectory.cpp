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

Error refusal(int number, std::string text) {
  return {std::string(domains::kPOSIX), number, std::move(text), nullptr};
}

Error alreadyThere(const std::string& path) {
  return refusal(EEXIST, path + " exists already; choose another name, or remove it");
}

/// In the hidden folder, a file that is made first and goes last, and what is to be published.
constexpr const char* kMark = ".appsync-draft";
constexpr const char* kContent = "content";

/// Whether a hidden folder that was there is a draft's: it has the mark, or nothing was put in it yet.
Result<bool> isDraft(int shell) {
  struct stat status {};
  if (fstatat(shell, kMark, &status, AT_SYMLINK_NOFOLLOW) == 0) return true;
  device::FolderEntries entries(shell);
  const bool isEmpty = entries.next() == nullptr;
  if (entries.failure() != 0) return Error::fromErrno(entries.failure());
  return isEmpty;
}

/// Removes all but the mark: a kill leaves what is known as a draft.
int clear(int shell) {
  device::FolderEntries entries(shell);
  while (const char* name = entries.next()) {
    if (name == std::string_view(kMark)) continue;
    if (const int number = device::tree::remove(shell, name, shell); number != 0) return number;
  }
  return entries.failure();
}

int makeContent(int shell, device::FileDescriptor& content) {
  int number = device::tree::create(shell, kMark, {});
  if (number == EEXIST) number = clear(shell);
  if (number == 0) number = sys::makeFolder(shell, kContent);
  if (number != 0) return number;
  content = device::FileDescriptor(openat(shell, kContent, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  return content.valid() ? 0 : errno;
}

}  // namespace

FolderDraft::FolderDraft(std::string path, const std::filesystem::path& place, device::FileDescriptor parent)
    : path_(std::move(path)),
      name_(place.filename().string()),
      shellName_("." + name_ + ".partial"),
      shellPath_((place.parent_path() / shellName_).string()),
      parent_(std::move(parent)) {}

Result<FolderDraft> FolderDraft::make(const std::string& path) {
  std::filesystem::path place = std::filesystem::path(path).lexically_normal();
  if (place.filename().empty()) place = place.parent_path();
  const std::string name = place.filename().string();
  if (name.empty() || name == "." || name == "..") return alreadyThere(path);
  const std::string parentPath = place.has_parent_path() ? place.parent_path().string() : ".";
  device::FileDescriptor parent(::open(parentPath.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!parent.valid()) return Error::fromErrno(errno, parentPath + ", in which " + name + " is to be made");
  struct stat status {};
  if (fstatat(parent.get(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) return alreadyThere(path);
  FolderDraft draft(path, place, std::move(parent));
  RETURN_IF_ERROR(draft.takeHold());
  return draft;
}

Result<bool> FolderDraft::lockShell() {
  const int made = sys::makeFolder(parent_.get(), shellName_.c_str());
  if (made != 0 && made != EEXIST) return Error::fromErrno(made, path_);
  device::FileDescriptor shell(
      openat(parent_.get(), shellName_.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!shell.valid() && errno == ENOENT) return false;
  if (!shell.valid()) return Error::fromErrno(errno, shellPath_);
  if (flock(shell.get(), LOCK_EX | LOCK_NB) != 0) {
    return refusal(errno, path_ + " is just being made by another process; wait until that has ended");
  }
  // Its holder may have ended between the opening and the lock, and taken it away.
  struct stat locked {};
  struct stat named {};
  if (fstat(shell.get(), &locked) != 0) return Error::fromErrno(errno, shellPath_);
  const bool isThere = fstatat(parent_.get(), shellName_.c_str(), &named, AT_SYMLINK_NOFOLLOW) == 0;
  if (!isThere || locked.st_dev != named.st_dev || locked.st_ino != named.st_ino) return false;
  const Result<bool> isOurs = isDraft(shell.get());
  if (!isOurs) return isOurs.error().in(shellPath_);
  if (!*isOurs) {
    return refusal(EEXIST, shellPath_ +
                               " is in the way and holds no unfinished backup; move it away, or choose another "
                               "name");
  }
  shell_ = std::move(shell);
  return true;
}

Status FolderDraft::takeHold() {
  for (bool isLocked = false; !isLocked;) {
    const Result<bool> locked = lockShell();
    if (!locked) return locked.error();
    isLocked = *locked;
  }
  const int number = makeContent(shell_.get(), folder_);
  return number == 0 ? Status() : Status(Error::fromErrno(number, path_));
}

FolderDraft::~FolderDraft() {
  if (!shell_.valid()) return;
  if (clear(shell_.get()) != 0) return;
  static_cast<void>(sys::removeFile(shell_.get(), kMark));
  static_cast<void>(sys::removeEmptyFolder(parent_.get(), shellName_.c_str()));
}

std::string FolderDraft::folderPath() const {
  return shellPath_ + "/" + kContent;
}

Status FolderDraft::publish() {
  int number = sys::syncFileSystem(folder_.get());
  if (number == 0) number = sys::rename(shell_.get(), kContent, parent_.get(), name_.c_str(), sys::Replace::no);
  if (number == EEXIST) return alreadyThere(path_);
  if (number != 0) return Error::fromErrno(number, path_);
  number = sys::syncFileSystem(parent_.get());
  return number == 0 ? Status() : Status(Error::fromErrno(number, path_));
}

}  // namespace appsync::host
