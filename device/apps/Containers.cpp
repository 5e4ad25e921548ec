#include "device/apps/Containers.h"

#include <cerrno>
#include <utility>

#include <fcntl.h>

#include "device/apps/AppRecord.h"
#include "device/storage/FileTree.h"
#include "device/storage/RandomNames.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

namespace {

constexpr std::string_view kPendingSuffix = ".tmp";

Status outcome(int error, std::string_view what) {
  if (error == 0) return {};
  return Error::fromErrno(error, what);
}

}  // namespace

PendingContainer::PendingContainer(DeviceFileSystem& files, FileDescriptor parent)
    : files_(&files), parent_(std::move(parent)), name_(newUUID()), nameNow_(name_ + std::string(kPendingSuffix)) {}

Result<PendingContainer> PendingContainer::make(DeviceFileSystem& files) {
  Result<FileDescriptor> parent = files.root().open(kContainersPath, O_PATH | O_DIRECTORY);
  if (!parent) return parent.error();
  PendingContainer container(files, std::move(parent).value());
  const int parentFolder = container.parent_.get();
  const char* name = container.nameNow_.c_str();
  if (const int error = sys::makeFolder(parentFolder, name); error != 0) {
    container.released_ = true;  // Nothing to remove.
    return Error::fromErrno(error, "a container for the app");
  }
  container.folder_ = FileDescriptor(openat(parentFolder, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!container.folder_.valid()) return Error::fromErrno(errno, "a container for the app");
  return container;
}

PendingContainer::~PendingContainer() {
  const bool movedFrom = !parent_.valid();
  if (!released_ && !movedFrom) static_cast<void>(tree::remove(parent_.get(), nameNow_.c_str(), files_->work()));
}

Status PendingContainer::writeFile(std::string_view name, ByteView bytes) {
  const std::string file(name);
  const int removed = sys::removeFile(folder(), file.c_str());
  if (removed != 0 && removed != ENOENT) return Error::fromErrno(removed, name);
  return outcome(tree::create(folder(), file.c_str(), bytes), name);
}

Status PendingContainer::commit(Durability durability) {
  int error = sys::rename(parent_.get(), nameNow_.c_str(), parent_.get(), name_.c_str(), sys::Replace::no);
  if (error == 0) nameNow_ = name_;
  if (error == 0 && durability == Durability::power) error = sys::syncFileSystem(folder());
  return outcome(error, "the app's container");
}

void removeContainer(DeviceFileSystem& files, const std::string& name) {
  const Result<FileDescriptor> parent = files.root().open(kContainersPath, O_PATH | O_DIRECTORY);
  if (parent) static_cast<void>(tree::remove(parent->get(), name.c_str(), files.work()));
}

}  // namespace appsync::device
