#include "host/PackageSender.h"

#include <algorithm>
#include <cerrno>

#include <fcntl.h>
#include <unistd.h>

#include "device/storage/FaultPoint.h"
#include "device/storage/SystemCalls.h"
#include "host/StagingArea.h"
#include "platform/SyncFiles.h"

namespace appsync::host {
namespace {

constexpr std::size_t kPiece = std::size_t{4} << 20;

bool isUnsupportedByFileSystem(int error) {
  return error == EXDEV || error == ENOSYS || error == EINVAL || error == EOPNOTSUPP || error == EBADF;
}

/// Copies at most one piece through memory, where the kernel cannot copy between the files.
int copyPieceThroughMemory(int from, int to, std::size_t& copied) {
  Bytes buffer(std::min(kPiece, std::size_t{256} * 1024));
  ssize_t count = -1;
  do {
    count = ::read(from, buffer.data(), buffer.size());
  } while (count < 0 && errno == EINTR);
  if (count < 0) return errno;
  const off_t end = ::lseek(to, 0, SEEK_CUR);
  copied = static_cast<std::size_t>(count);
  const int failed = device::sys::writeAt(to, ByteView(buffer).first(copied), end);
  if (failed == 0) ::lseek(to, end + count, SEEK_SET);
  return failed;
}

/// Copies at most one piece; `copied` is 0 at the end of the file.
int copyPiece(int from, int to, std::size_t& copied) {
  if (const int failed = device::faultPoint("send package"); failed != 0) return failed;
  ssize_t count = -1;
  do {
    count = ::copy_file_range(from, nullptr, to, nullptr, kPiece, 0);
  } while (count < 0 && errno == EINTR);
  copied = count < 0 ? 0 : static_cast<std::size_t>(count);
  if (count >= 0) return 0;
  return isUnsupportedByFileSystem(errno) ? copyPieceThroughMemory(from, to, copied) : errno;
}

int copyFile(int from, int to, std::uint64_t size, const PackageSender::GoOn& goOn) {
  std::uint64_t done = 0;
  for (;;) {
    if (!goOn(size == 0 ? 0 : std::min(1.0, static_cast<double>(done) / static_cast<double>(size)))) return ECANCELED;
    std::size_t copied = 0;
    if (const int failed = copyPiece(from, to, copied); failed != 0) return failed;
    if (copied == 0) return 0;
    done += copied;
  }
}

int copyInto(int from, int folder, const std::string& name, std::uint64_t size, const PackageSender::GoOn& goOn) {
  device::FileDescriptor to;
  int failed = device::sys::createFile(folder, name.c_str(), device::sys::kFileMode, to);
  if (failed == 0) failed = copyFile(from, to.get(), size, goOn);
  if (failed != 0 && to.valid()) static_cast<void>(device::sys::removeFile(folder, name.c_str()));
  return failed;
}

/// Hard-links the library's file, if both are on one file system: the device only reads a package, and removes only the
/// link. Copies would be flushed to the disk together with every app that is installed meanwhile.
int linkPackage(int from, int folder, const std::string& name, const PackageSender::GoOn& goOn) {
  if (!goOn(0)) return ECANCELED;
  if (const int failed = device::faultPoint("send package"); failed != 0) return failed;
  if (::linkat(from, "", folder, name.c_str(), AT_EMPTY_PATH) != 0) {
    const std::string path = "/proc/self/fd/" + std::to_string(from);
    if (::linkat(AT_FDCWD, path.c_str(), folder, name.c_str(), AT_SYMLINK_FOLLOW) != 0) return errno;
  }
  if (goOn(1)) return 0;
  static_cast<void>(device::sys::removeFile(folder, name.c_str()));
  return ECANCELED;
}

}  // namespace

Result<std::string> PackageSender::send(const LibraryPackage& package, const GoOn& goOn) {
  const device::FileDescriptor from(::open(package.path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  if (!from.valid()) return Error::fromErrno(errno, package.path + " cannot be read");
  const std::string folder = std::string(kPublicStaging) + "/" + std::string(kPackagesFolder);
  Status made = files_.createDirectory(folder, platform::IntermediateDirectories::create, {});
  if (!made) return made.error();
  const std::string name = std::to_string(++sent_) + ".zip";
  const Result<device::RootDirectory::Place> place = files_.root().place(folder + "/" + name);
  if (!place) return place.error();
  int failed = linkPackage(from.get(), place->folder.get(), name, goOn);
  if (failed != 0 && failed != ECANCELED) failed = copyInto(from.get(), place->folder.get(), name, package.bytes, goOn);
  if (failed == 0) return std::string(kPackagesFolder) + "/" + name;
  return Error::fromErrno(failed, package.path + " cannot be sent to the device");
}

}  // namespace appsync::host
