#include "tools/HostFile.h"

#include <cerrno>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "device/FileDescriptor.h"
#include "device/HostFile.h"

namespace appsync::tools {
namespace {

/// An opened file, or a standard stream, which is not this object's to close.
class Stream {
 public:
  Stream(const std::string& path, int standard, int flags)
      : opened_(path == kStandardStream ? -1 : ::open(path.c_str(), flags | O_CLOEXEC)),
        number_(path == kStandardStream ? standard : opened_.get()) {}
  [[nodiscard]] int number() const { return number_; }

 private:
  device::FileDescriptor opened_;
  int number_;
};

Status readAll(int file, Bytes& bytes, const std::string& path) {
  constexpr std::size_t kStep = std::size_t{256} * 1024;
  std::size_t held = 0;
  for (;;) {
    bytes.resize(held + kStep);
    const ssize_t count = ::read(file, bytes.data() + held, kStep);
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) return Error::fromErrno(errno, path + " cannot be read");
    held += static_cast<std::size_t>(count);
    if (count == 0) break;
  }
  bytes.resize(held);
  return {};
}

Status writeAll(int file, ByteView bytes, const std::string& path) {
  while (!bytes.empty()) {
    const ssize_t count = ::write(file, bytes.data(), bytes.size());
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) return Error::fromErrno(errno, path + " cannot be written");
    bytes = bytes.subspan(static_cast<std::size_t>(count));
  }
  return {};
}

bool existsButIsNoFile(const std::string& path) {
  struct stat found = {};
  return ::stat(path.c_str(), &found) == 0 && !S_ISREG(found.st_mode);
}

Status writeStream(const std::string& path, ByteView bytes) {
  const Stream file(path, STDOUT_FILENO, O_WRONLY);
  if (file.number() < 0) return Error::fromErrno(errno, path + " cannot be written");
  const Status written = writeAll(file.number(), bytes, path == kStandardStream ? "standard output" : path);
  const bool readerLeft = !written && written.error().code == EPIPE;
  return readerLeft ? Status() : written;
}

}  // namespace

Result<Bytes> readHostFile(const std::string& path) {
  const Stream file(path, STDIN_FILENO, O_RDONLY);
  if (file.number() < 0) return Error::fromErrno(errno, path + " cannot be read");
  Bytes bytes;
  if (Status read = readAll(file.number(), bytes, path); !read) return read.error();
  return bytes;
}

Status writeHostFile(const std::string& path, ByteView bytes) {
  if (path == kStandardStream || existsButIsNoFile(path)) return writeStream(path, bytes);
  return device::replaceHostFile(path, bytes);
}

}  // namespace appsync::tools
