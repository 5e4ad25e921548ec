#include "device/packages/PackageUnpacker.h"

#include <cerrno>
#include <optional>
#include <utility>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/packages/InstallerError.h"
#include "device/storage/RootDirectory.h"
#include "device/storage/SystemCalls.h"
#include "platform/SyncFiles.h"

namespace appsync::device {

namespace {

/// Creates the files and directories of a package. Most entries are sorted by directory, so the last one stays open.
class Unpacking {
 public:
  Unpacking(PackageReader& package, int container) : package_(package), container_(container) {}

  Status unpack(const PackageReader::Entry& entry) {
    if (entry.kind == PackageReader::Kind::folder) return outcome(enter(entry.path), entry.path);
    const std::size_t slash = entry.path.rfind('/');
    const bool top = slash == entry.path.npos;
    if (const int error = top ? 0 : enter(entry.path.substr(0, slash)); error != 0) return outcome(error, entry.path);
    FileDescriptor file;
    const mode_t mode = entry.executable ? 0755 : sys::kFileMode;
    const int error = top ? sys::createFile(container_, entry.path.c_str(), mode, file)
                          : sys::createFile(folder_.get(), entry.path.c_str() + slash + 1, mode, file);
    if (error != 0) return outcome(error, entry.path);
    return fill(file.get(), entry.path);
  }

  /// The content of "Info.plist", or nullopt until it was unpacked.
  [[nodiscard]] const std::optional<Bytes>& info() const noexcept { return info_; }

 private:
  /// Makes a directory of the container the current one. Creates it and its parents if they are missing.
  int enter(const std::string& path) {
    if (path == path_ && folder_.valid()) return 0;
    FileDescriptor opened;
    int error = open(container_, path, opened);
    if (error == ENOENT) error = make(path, opened);
    if (error != 0) return error;
    folder_ = std::move(opened);
    path_ = path;
    return 0;
  }

  static int open(int folder, const std::string& path, FileDescriptor& opened) {
    return openBeneath(folder, path, O_PATH | O_DIRECTORY | O_NOFOLLOW, 0, Resolution::kernel, opened);
  }

  int make(const std::string& path, FileDescriptor& opened) {
    const std::size_t slash = path.rfind('/');
    if (slash == path.npos) {
      if (const int error = sys::makeFolder(container_, path.c_str()); error != 0) return error;
      return open(container_, path, opened);
    }
    if (const int error = enter(path.substr(0, slash)); error != 0) return error;
    const std::string name = path.substr(slash + 1);
    if (const int error = sys::makeFolder(folder_.get(), name.c_str()); error != 0) return error;
    return open(folder_.get(), name, opened);
  }

  Status fill(int file, const std::string& path) {
    const bool isInfo = isInfoFile(path, package_.appFolder());
    if (isInfo) info_.emplace();
    PackageReader::Block block;
    for (;;) {
      const Result<bool> more = package_.nextBlock(block);
      if (!more) return more.error();
      if (!*more) return {};
      if (const int error = sys::writeAt(file, block.bytes, block.offset); error != 0) return outcome(error, path);
      if (isInfo && info_->size() <= kMaximumMetadataBytes) {
        info_->insert(info_->end(), block.bytes.begin(), block.bytes.end());
      }
    }
  }

  static Status outcome(int error, const std::string& path) {
    if (error == 0) return {};
    if (error != EEXIST && error != ENOTDIR && error != ELOOP) return Error::fromErrno(error, path);
    return installerError(InstallerFailure::duplicateEntry,
                          "the package holds \"" + path + "\" as a file and as a folder; make the package again");
  }

  PackageReader& package_;
  int container_;
  std::string path_;
  FileDescriptor folder_;
  std::optional<Bytes> info_;
};

}  // namespace

Result<UnpackedPackage> unpackPackage(PackageReader& package, int folder,
                                      const std::function<bool(double fraction)>& shouldContinue) {
  Unpacking unpacking(package, folder);
  PackageReader::Entry entry;
  for (;;) {
    const Result<bool> more = package.next(entry);
    if (!more) return more.error();
    if (!*more) break;
    RETURN_IF_ERROR(unpacking.unpack(entry));
    if (!shouldContinue(package.fraction())) {
      return installerError(InstallerFailure::cancelled, "the install was cancelled; start it again to have the app");
    }
  }
  if (!unpacking.info()) return missingInfo(package.appFolder());
  Result<BundleInfo> info = readBundleInfo(*unpacking.info());
  if (!info) return info.error();
  return UnpackedPackage{package.appFolder(), std::move(info).value(), package.unpackedBytes()};
}

}  // namespace appsync::device
