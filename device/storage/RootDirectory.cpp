#include "device/storage/RootDirectory.h"

#include <atomic>
#include <cerrno>
#include <deque>
#include <vector>

#include <fcntl.h>
#include <limits.h>
#include <linux/openat2.h>
#include <sys/stat.h>
#include <sys/syscall.h>

namespace appsync::device {

namespace {

constexpr int kMaximumLinks = 40;

/// Whether openat2 exists; false after ENOSYS.
std::atomic<bool> kernelResolves{true};

int openByKernel(int folder, const char* path, int flags, mode_t mode, FileDescriptor& file) {
  open_how how{};
  how.flags = static_cast<unsigned>(flags) | O_CLOEXEC;
  how.mode = mode;
  how.resolve = RESOLVE_BENEATH | RESOLVE_NO_MAGICLINKS;
  for (;;) {
    const long descriptor = syscall(SYS_openat2, folder, path, &how, sizeof how);
    if (descriptor >= 0) {
      file = FileDescriptor(static_cast<int>(descriptor));
      return 0;
    }
    // EAGAIN: a rename during the call made the resolution of ".." unsafe.
    if (errno != EINTR && errno != EAGAIN) return errno;
  }
}

void pushFront(std::deque<std::string>& components, std::string_view path) {
  std::vector<std::string> parts;
  while (!path.empty()) {
    const std::size_t end = std::min(path.find('/'), path.size());
    if (end > 0) parts.emplace_back(path.substr(0, end));
    path.remove_prefix(std::min(end + 1, path.size()));
  }
  components.insert(components.begin(), parts.begin(), parts.end());
}

/// Reads a link. Returns 0 or an errno value: EINVAL if it is not a link.
int readLink(int folder, const char* name, std::string& target) {
  char buffer[PATH_MAX];
  const ssize_t length = readlinkat(folder, name, buffer, sizeof buffer);
  if (length < 0) return errno;
  target.assign(buffer, static_cast<std::size_t>(length));
  return 0;
}

/// Resolves a path with every directory on the way open, so that ".." is the directory it came from even if the tree
/// changes.
class Walk {
 public:
  Walk(int folder, std::string_view path) : top_(folder) { pushFront(components_, path); }

  int open(int flags, mode_t mode, FileDescriptor& file) {
    while (components_.size() > 1 || (components_.size() == 1 && components_.front() == "..")) {
      if (const int error = enterNext(); error != 0) return error;
    }
    if (components_.empty()) return openIn(".", flags, mode, file);
    const std::string name = components_.front();
    const bool follow = (flags & O_NOFOLLOW) == 0;
    const int error = openIn(name.c_str(), flags | O_NOFOLLOW, mode, file);
    const bool link = error == ELOOP || (error == 0 && (flags & O_PATH) != 0) || error == ENOTDIR;
    if (!follow || !link) return error;
    std::string target;
    if (readLink(folder(), name.c_str(), target) != 0) return error;
    if (const int failed = followLink(target); failed != 0) return failed;
    return open(flags, mode, file);
  }

 private:
  [[nodiscard]] int folder() const { return entered_.empty() ? top_ : entered_.back().get(); }

  int openIn(const char* name, int flags, mode_t mode, FileDescriptor& file) const {
    file = FileDescriptor(openat(folder(), name, flags | O_CLOEXEC, mode));
    return file.valid() ? 0 : errno;
  }

  int enterNext() {
    const std::string name = std::move(components_.front());
    components_.pop_front();
    if (name == ".") return 0;
    if (name == "..") {
      if (entered_.empty()) return EXDEV;
      entered_.pop_back();
      return 0;
    }
    FileDescriptor next;
    const int error = openIn(name.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW, 0, next);
    if (error == 0) {
      entered_.push_back(std::move(next));
      return 0;
    }
    std::string target;
    if (error != ENOTDIR || readLink(folder(), name.c_str(), target) != 0) return error;
    components_.push_front({});  // followLink replaces the first component.
    return followLink(target);
  }

  int followLink(const std::string& target) {
    if (++links_ > kMaximumLinks) return ELOOP;
    if (target.starts_with('/')) return EXDEV;
    components_.pop_front();
    pushFront(components_, target);
    return 0;
  }

  int top_;
  std::vector<FileDescriptor> entered_;
  std::deque<std::string> components_;
  int links_ = 0;
};

std::string_view withoutSlashesAtEnd(std::string_view path) {
  while (path.size() > 1 && path.ends_with('/'))
    path.remove_suffix(1);
  return path;
}

Error pathError(int error, std::string_view path) {
  if (error != EXDEV) return Error::fromErrno(error, path);
  return {std::string(domains::kPOSIX), EXDEV, std::string(path) + ": leads outside the device", nullptr};
}

}  // namespace

int openBeneath(int folder, const std::string& path, int flags, mode_t mode, Resolution resolution,
                FileDescriptor& file) {
  if (resolution == Resolution::kernel && kernelResolves.load(std::memory_order_relaxed)) {
    const int error = openByKernel(folder, path.c_str(), flags, mode, file);
    if (error != ENOSYS && error != EPERM) return error;
    if (error == ENOSYS) kernelResolves = false;
  }
  return Walk(folder, path).open(flags, mode, file);
}

Result<RootDirectory> RootDirectory::open(const std::string& hostPath, Resolution resolution) {
  FileDescriptor root(::open(hostPath.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
  if (!root.valid()) return Error::fromErrno(errno, hostPath);
  return RootDirectory(std::move(root), resolution);
}

Result<FileDescriptor> RootDirectory::open(std::string_view path, int flags) const {
  return resolve(path, path, flags);
}

Result<FileDescriptor> RootDirectory::resolve(std::string_view whole, std::string_view path, int flags) const {
  if (path.empty()) return Error::fromErrno(ENOENT, "an empty path");
  if (!path.starts_with('/') || path.find('\0') != path.npos) return Error::fromErrno(EINVAL, whole);
  path.remove_prefix(std::min(path.find_first_not_of('/'), path.size()));
  FileDescriptor file;
  const int error = openBeneath(root_.get(), path.empty() ? "." : std::string(path), flags, 0, resolution_, file);
  if (error != 0) return pathError(error, whole);
  return file;
}

Result<RootDirectory::Place> RootDirectory::place(std::string_view path) const {
  const std::string_view whole = withoutSlashesAtEnd(path);
  const std::size_t slash = whole.rfind('/');
  if (slash == whole.npos) return Error::fromErrno(whole.empty() ? ENOENT : EINVAL, path);
  const std::string_view name = whole.substr(slash + 1);
  if (name.empty() || name == "." || name == "..") return Error::fromErrno(EBUSY, path);
  Result<FileDescriptor> folder = resolve(path, slash == 0 ? "/" : whole.substr(0, slash), O_PATH | O_DIRECTORY);
  if (!folder) return folder.error();
  if (name.find('\0') != name.npos) return Error::fromErrno(EINVAL, path);
  return Place{std::move(folder).value(), std::string(name)};
}

}  // namespace appsync::device
