#include "device/storage/DeviceFileSystem.h"

#include <cerrno>
#include <limits>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/xattr.h>

#include "base/ReturnIfError.h"
#include "device/storage/FileTree.h"
#include "device/storage/RandomNames.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

namespace {

constexpr const char* kOwnerAttribute = "user.appsync.owner";
constexpr const char* kGroupAttribute = "user.appsync.group";

Status outcome(int error, std::string_view path) {
  if (error == 0) return {};
  return Error::fromErrno(error, path);
}

void keepName(int file, const char* attribute, const std::optional<std::string>& name) {
  // Not an error: some file systems have no extended attributes.
  if (name) static_cast<void>(fsetxattr(file, attribute, name->data(), name->size(), 0));
}

void keepOwners(int file, const platform::OwnerAttributes& owners) {
  keepName(file, kOwnerAttribute, owners.ownerAccountName);
  keepName(file, kGroupAttribute, owners.groupOwnerAccountName);
}

std::optional<std::string> keptName(int file, const char* attribute) {
  char name[256];
  const ssize_t length = fgetxattr(file, attribute, name, sizeof name);
  if (length < 0) return std::nullopt;
  return std::string(name, static_cast<std::size_t>(length));
}

/// An item of the work directory, removed on destruction unless `place` succeeded.
class Draft {
 public:
  explicit Draft(int work) : work_(work), name_(temporaryName()) {}
  ~Draft() {
    if (!placed_) static_cast<void>(tree::remove(work_, name_.c_str(), work_));
  }
  Draft(const Draft&) = delete;
  Draft& operator=(const Draft&) = delete;

  [[nodiscard]] const char* name() const noexcept { return name_.c_str(); }

  [[nodiscard]] int place(const RootDirectory::Place& place, sys::Replace replace) {
    const int error = sys::rename(work_, name(), place.folder.get(), place.name.c_str(), replace);
    placed_ = error == 0;
    return error;
  }

 private:
  int work_;
  std::string name_;
  bool placed_ = false;
};

int writeDraft(int work, const char* name, ByteView bytes, const platform::OwnerAttributes& owners,
               FileDescriptor& file) {
  if (const int error = sys::createFile(work, name, sys::kFileMode, file); error != 0) return error;
  if (const int error = sys::writeAt(file.get(), bytes, 0); error != 0) return error;
  keepOwners(file.get(), owners);
  return 0;
}

}  // namespace

Result<RootDirectory::Place> DeviceFileSystem::placeToChange(std::string_view path) const {
  if (access_ == Access::readOnly) return Error::fromErrno(EROFS, path);
  return root_.place(path);
}

bool DeviceFileSystem::fileExists(std::string_view path) {
  return root_.open(path, O_PATH).ok();
}

Result<platform::FileAttributes> DeviceFileSystem::attributesOfItem(std::string_view path) {
  const Result<FileDescriptor> file = root_.open(path, O_PATH);
  if (!file) return file.error();
  struct stat status {};
  if (fstat(file->get(), &status) != 0) return Error::fromErrno(errno, path);
  const bool isDirectory = S_ISDIR(status.st_mode);
  return platform::FileAttributes{isDirectory ? 0 : static_cast<std::uint64_t>(status.st_size), isDirectory};
}

Result<Bytes> DeviceFileSystem::readFile(std::string_view path) {
  const Result<FileDescriptor> file = root_.open(path, O_RDONLY | O_NONBLOCK);
  if (!file) return file.error();
  Bytes bytes;
  const int error = tree::read(file->get(), std::numeric_limits<std::uint64_t>::max(), bytes);
  if (error != 0) return Error::fromErrno(error, path);
  return bytes;
}

Status DeviceFileSystem::writeFileAtomically(std::string_view path, ByteView bytes) {
  return writeNew(path, bytes, {}, Durability::power);
}

Status DeviceFileSystem::createFile(std::string_view path, ByteView bytes,
                                    const platform::OwnerAttributes& attributes) {
  return writeNew(path, bytes, attributes, Durability::process);
}

Status DeviceFileSystem::writeNew(std::string_view path, ByteView bytes, const platform::OwnerAttributes& attributes,
                                  Durability durability) {
  const Result<RootDirectory::Place> place = placeToChange(path);
  if (!place) return place.error();
  Draft draft(work());
  FileDescriptor file;
  int error = writeDraft(work(), draft.name(), bytes, attributes, file);
  if (error == 0 && durability == Durability::power) error = sys::writeOut(file.get());
  if (error == 0) error = draft.place(*place, sys::Replace::yes);
  return outcome(error, path);
}

Status DeviceFileSystem::createDirectory(std::string_view path, platform::IntermediateDirectories intermediates,
                                         const platform::OwnerAttributes& attributes) {
  const bool createParents = intermediates == platform::IntermediateDirectories::create;
  if (createParents && path.find_first_not_of('/') == path.npos && !path.empty()) return {};
  Result<RootDirectory::Place> place = placeToChange(path);
  if (!place && place.error().code == ENOENT && createParents) {
    const std::string_view parent = path.substr(0, path.find_last_of('/', path.find_last_not_of('/')));
    RETURN_IF_ERROR(createDirectory(parent.empty() ? "/" : parent, intermediates, attributes));
    place = placeToChange(path);
  }
  if (!place) return place.error();
  const int folder = place->folder.get();
  const char* name = place->name.c_str();
  const int error = sys::makeFolder(folder, name);
  if (error == EEXIST && createParents && root_.open(path, O_PATH | O_DIRECTORY).ok()) return {};
  if (error != 0) return Error::fromErrno(error, path);
  const FileDescriptor made(openat(folder, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (made.valid()) keepOwners(made.get(), attributes);
  return {};
}

Status DeviceFileSystem::copyItem(std::string_view from, std::string_view to) {
  const Result<RootDirectory::Place> source = root_.place(from);
  if (!source) return source.error();
  const Result<RootDirectory::Place> place = placeToChange(to);
  if (!place) return place.error();
  Draft draft(work());
  std::uint64_t bytes = 0;
  int error = tree::copy(source->folder.get(), source->name.c_str(), work(), draft.name(), bytes);
  if (error != 0) return Error::fromErrno(error, from);
  error = draft.place(*place, sys::Replace::no);
  return outcome(error, to);
}

Status DeviceFileSystem::moveItem(std::string_view from, std::string_view to) {
  const Result<RootDirectory::Place> source = placeToChange(from);
  if (!source) return source.error();
  const Result<RootDirectory::Place> place = placeToChange(to);
  if (!place) return place.error();
  const int error = sys::rename(source->folder.get(), source->name.c_str(), place->folder.get(), place->name.c_str(),
                                sys::Replace::no);
  return outcome(error, error == EEXIST ? to : from);
}

Status DeviceFileSystem::removeItem(std::string_view path) {
  const Result<RootDirectory::Place> place = placeToChange(path);
  if (!place) return place.error();
  return outcome(tree::remove(place->folder.get(), place->name.c_str(), work()), path);
}

Status DeviceFileSystem::touch(std::string_view path) {
  if (access_ == Access::readOnly) return Error::fromErrno(EROFS);
  const Result<FileDescriptor> file = root_.open(path, O_RDONLY | O_NONBLOCK);
  return outcome(file ? sys::touch(file->get()) : static_cast<int>(file.error().code), {});
}

Result<platform::OwnerAttributes> DeviceFileSystem::ownersOfItem(std::string_view path) {
  const Result<FileDescriptor> file = root_.open(path, O_RDONLY | O_NONBLOCK);
  if (!file) return file.error();
  return platform::OwnerAttributes{keptName(file->get(), kOwnerAttribute), keptName(file->get(), kGroupAttribute)};
}

}  // namespace appsync::device
