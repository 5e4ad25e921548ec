#include "tools/FolderDraft.h"

#include <cerrno>
#include <filesystem>
#include <utility>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "device/FileTree.h"
#include "device/SystemCalls.h"

namespace appsync::tools {
namespace {

namespace sys = device::sys;

Error refusal(int number, std::string text) {
  return {std::string(domains::kPOSIX), number, std::move(text), nullptr};
}

Error alreadyThere(const std::string& path) {
  return refusal(EEXIST, path + " exists already; choose another name, or remove it");
}

}  // namespace

FolderDraft::FolderDraft(std::string path, std::string name, device::FileDescriptor parent)
    : path_(std::move(path)),
      name_(std::move(name)),
      draftName_("." + name_ + ".partial"),
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
  FolderDraft draft(path, name, std::move(parent));
  if (Status held = draft.takeHold(); !held) return held.error();
  return draft;
}

Status FolderDraft::takeHold() {
  const int made = sys::makeFolder(parent_.get(), draftName_.c_str());
  if (made != 0 && made != EEXIST) return Error::fromErrno(made, path_);
  device::FileDescriptor folder(
      openat(parent_.get(), draftName_.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!folder.valid()) return Error::fromErrno(errno, path_);
  if (flock(folder.get(), LOCK_EX | LOCK_NB) != 0) {
    return refusal(errno, path_ + " is just being made by another process; wait until that has ended");
  }
  const int emptied = device::tree::empty(folder.get(), folder.get());
  if (emptied != 0) return Error::fromErrno(emptied, path_);
  folder_ = std::move(folder);
  return {};
}

FolderDraft::~FolderDraft() {
  if (!folder_.valid()) return;
  static_cast<void>(device::tree::empty(folder_.get(), folder_.get()));
  static_cast<void>(sys::removeEmptyFolder(parent_.get(), draftName_.c_str()));
}

Status FolderDraft::publish() {
  int number = sys::syncFileSystem(folder_.get());
  if (number == 0) {
    number = sys::rename(parent_.get(), draftName_.c_str(), parent_.get(), name_.c_str(), sys::Replace::no);
  }
  if (number == EEXIST) return alreadyThere(path_);
  if (number != 0) return Error::fromErrno(number, path_);
  folder_ = device::FileDescriptor();
  number = sys::syncFileSystem(parent_.get());
  return number == 0 ? Status() : Status(Error::fromErrno(number, path_));
}

}  // namespace appsync::tools
