#include "device/storage/HostFile.h"

#include <array>
#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <string_view>
#include <vector>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "base/ReturnIfError.h"
#include "device/storage/FileDescriptor.h"
#include "device/storage/FileTree.h"
#include "device/storage/RandomNames.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

namespace {

namespace fs = std::filesystem;

/// Separates a file's name from a random one in the name of its incomplete replacement.
constexpr std::string_view kDraftMark = ".draft-";
constexpr int kDraftAttempts = 8;
/// The limit of Linux.
constexpr int kMostLinks = 40;

Error cannotWrite(const std::string& path, int error) {
  return Error::fromErrno(error, path + " cannot be written");
}

Error cannotRead(const std::string& path, int error) {
  return Error::fromErrno(error, path + " cannot be read");
}

Error tooLarge(const std::string& path, std::uint64_t most) {
  return {std::string(domains::kPOSIX), EFBIG,
          path + " cannot be read: it has more than " + std::to_string(most / 1'000'000) + " MB", nullptr};
}

Error noFile(const std::string& path) {
  return {std::string(domains::kPOSIX), EINVAL, path + " cannot be read: it is a pipe or a device, not a file",
          nullptr};
}

/// An opened file, closed on destruction, or a standard stream, which stays open.
class Stream {
 public:
  Stream(const std::string& path, int standard, int flags)
      : opened_(path == kStandardStream ? -1 : ::open(path.c_str(), flags | O_NOCTTY | O_CLOEXEC)),
        descriptor_(path == kStandardStream ? standard : opened_.get()) {}
  [[nodiscard]] int descriptor() const { return descriptor_; }

 private:
  FileDescriptor opened_;
  int descriptor_;
};

int copyAll(int from, int to) {
  std::array<std::byte, std::size_t{128} * 1024> block;
  for (off_t offset = 0;;) {
    const ssize_t count = ::pread(from, block.data(), block.size(), offset);
    if (count < 0 && errno == EINTR) continue;
    if (count <= 0) return count < 0 ? errno : 0;
    if (const int failed = writeAll(to, ByteView(block).first(static_cast<std::size_t>(count))); failed != 0) {
      return failed;
    }
    offset += count;
  }
}

/// Opens standard output, a pipe or a device and passes its descriptor to `write`, which returns 0 or an errno value.
template <class Write>
Status writeStream(const std::string& path, const Write& write) {
  const Stream stream(path, STDOUT_FILENO, O_WRONLY);
  const int failed = stream.descriptor() < 0 ? errno : write(stream.descriptor());
  if (failed == 0 || failed == EPIPE) return {};
  return cannotWrite(path == kStandardStream ? "standard output" : path, failed);
}

/// Collects the whole result before it writes the first byte to the stream.
Status fillStream(const std::string& path, const HostFileFill& fill) {
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> whole(std::tmpfile(), std::fclose);
  if (whole == nullptr) return Error::fromErrno(errno, "a temporary file cannot be made");
  const int file = ::fileno(whole.get());
  RETURN_IF_ERROR(fill(file));
  return writeStream(path, [&](int stream) { return copyAll(file, stream); });
}

int createDraft(const std::string& path, mode_t mode, std::string& draft, FileDescriptor& file) {
  int failed = EEXIST;
  for (int attempt = 0; failed == EEXIST && attempt < kDraftAttempts; ++attempt) {
    draft = path + std::string(kDraftMark) + temporaryName();
    failed = sys::createFile(AT_FDCWD, draft.c_str(), mode, file);
  }
  return failed;
}

Status replaceFile(const std::string& path, const HostFileFill& fill) {
  struct stat old = {};
  const bool isReplaced = ::lstat(path.c_str(), &old) == 0 && S_ISREG(old.st_mode);
  const mode_t mode = isReplaced ? old.st_mode & 0777U : sys::kFileMode;
  std::string draft;
  FileDescriptor file;
  // Never readable for more users than the old file, and always for this process.
  int failed = createDraft(path, (mode & sys::kFileMode) | S_IRUSR | S_IWUSR, draft, file);
  if (failed != 0) return cannotWrite(path, failed);
  const Status filled = fill(file.get());
  if (filled && isReplaced && ::fchmod(file.get(), mode) != 0) failed = errno;
  if (filled && failed == 0) failed = sys::writeOut(file.get());
  if (filled && failed == 0) {
    failed = sys::rename(AT_FDCWD, draft.c_str(), AT_FDCWD, path.c_str(), sys::Replace::yes);
  }
  if (filled && failed == 0) return {};
  static_cast<void>(sys::removeFile(AT_FDCWD, draft.c_str()));
  return filled ? Status(cannotWrite(path, failed)) : filled;
}

struct Place {
  std::string path;
  bool isStream = false;
};

/// Resolves the links of a result's path. The file at their end need not exist.
Result<Place> placeOf(const std::string& path) {
  if (path == kStandardStream) return Place{path, true};
  struct stat found = {};
  const bool exists = ::stat(path.c_str(), &found) == 0;
  if (!exists && errno != ENOENT) return cannotWrite(path, errno);
  if (exists && !S_ISREG(found.st_mode)) return Place{path, true};
  fs::path end = path;
  for (int links = 0; links < kMostLinks; ++links) {
    std::error_code isNoLink;
    const fs::path next = fs::read_symlink(end, isNoLink);
    if (isNoLink) return Place{end.string(), false};
    end = end.parent_path() / next;
  }
  return cannotWrite(path, ELOOP);
}

HostFileFill filledWith(ByteView bytes, const std::string& path) {
  return [bytes, path](int file) -> Status {
    const int failed = sys::writeAt(file, bytes, 0);
    return failed == 0 ? Status() : Status(cannotWrite(path, failed));
  };
}

bool isDraft(std::string_view name) {
  if (name.size() <= kDraftMark.size() + kTemporaryNameDigits) return false;
  const std::size_t end = name.size() - kTemporaryNameDigits;
  return name.substr(0, end).ends_with(kDraftMark) &&
         name.substr(end).find_first_not_of("0123456789abcdef") == name.npos;
}

}  // namespace

int writeAll(int stream, ByteView bytes) {
  while (!bytes.empty()) {
    const ssize_t count = ::write(stream, bytes.data(), bytes.size());
    if (count < 0 && errno == EINTR) continue;
    if (count <= 0) return count < 0 ? errno : ENOSPC;
    bytes = bytes.subspan(static_cast<std::size_t>(count));
  }
  return 0;
}

Result<Bytes> readHostFile(const std::string& path, std::uint64_t most) {
  const FileDescriptor file(::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  if (!file.valid()) return cannotRead(path, errno);
  Bytes bytes;
  const int failed = tree::read(file.get(), most, bytes);
  if (failed == EFBIG) return tooLarge(path, most);
  if (failed == EINVAL) return noFile(path);
  return failed == 0 ? Result<Bytes>(std::move(bytes)) : cannotRead(path, failed);
}

Result<Bytes> readHostStream(const std::string& path, std::uint64_t most) {
  constexpr std::size_t kStep = std::size_t{256} * 1024;
  const Stream stream(path, STDIN_FILENO, O_RDONLY);
  if (stream.descriptor() < 0) return cannotRead(path, errno);
  Bytes bytes;
  for (std::size_t held = 0;;) {
    bytes.resize(held + kStep);
    const ssize_t count = ::read(stream.descriptor(), bytes.data() + held, kStep);
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) return cannotRead(path, errno);
    held += static_cast<std::size_t>(count);
    if (held > most) return tooLarge(path, most);
    if (count > 0) continue;
    bytes.resize(held);
    return bytes;
  }
}

Status replaceHostFile(const std::string& path, ByteView bytes) {
  return replaceFile(path, filledWith(bytes, path));
}

Status writeHostFile(const std::string& path, ByteView bytes) {
  const Result<Place> place = placeOf(path);
  if (!place) return place.error();
  if (place->isStream) return writeStream(path, [&](int stream) { return writeAll(stream, bytes); });
  return replaceHostFile(place->path, bytes);
}

Status writeHostFile(const std::string& path, const HostFileFill& fill) {
  const Result<Place> place = placeOf(path);
  if (!place) return place.error();
  return place->isStream ? fillStream(path, fill) : replaceFile(place->path, fill);
}

void removeHostFileDrafts(int folder) {
  std::vector<std::string> drafts;
  FolderEntries entries(folder);
  while (const char* name = entries.next()) {
    if (isDraft(name)) drafts.emplace_back(name);
  }
  for (const std::string& draft : drafts)
    static_cast<void>(sys::removeFile(folder, draft.c_str()));
}

}  // namespace appsync::device
