#include "device/packages/PackageReader.h"

#include <algorithm>
#include <cerrno>
#include <utility>

#include <archive.h>
#include <archive_entry.h>
#include <locale.h>
#include <sys/stat.h>

#include "base/ReturnIfError.h"
#include "device/packages/BundleInfo.h"
#include "device/packages/InstallerError.h"
#include "platform/SyncFiles.h"

namespace appsync::device {

namespace {

constexpr std::size_t kReadSize = std::size_t{1} << 16;
constexpr std::string_view kMakeAgain = "; make the package again";

/// Sets the calling thread's locale to UTF-8 during its lifetime, because libarchive converts names to the locale.
class NamesAreUTF8 {
 public:
  NamesAreUTF8() : before_(uselocale(utf8())) {}
  ~NamesAreUTF8() { uselocale(before_); }
  NamesAreUTF8(const NamesAreUTF8&) = delete;
  NamesAreUTF8& operator=(const NamesAreUTF8&) = delete;

 private:
  static locale_t utf8() {
    static const locale_t locale = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
    return locale;  // Null if the system has no such locale; uselocale then does nothing.
  }

  locale_t before_;
};

bool isPlainComponent(std::string_view component) {
  constexpr std::string_view kForbidden("\\\0", 2);
  return !component.empty() && component != "." && component != ".." &&
         component.find_first_of(kForbidden) == component.npos;
}

/// Returns whether a path is relative and has only safe components.
bool isPlainPath(std::string_view path) {
  for (;;) {
    const std::size_t slash = path.find('/');
    if (!isPlainComponent(path.substr(0, slash))) return false;
    if (slash == path.npos) return true;
    path.remove_prefix(slash + 1);
  }
}

std::string quoted(std::string_view name) {
  return '"' + std::string(name) + '"';
}

/// Returns the error for a file that libarchive cannot open.
Error notOpened(int file) {
  char start[4] = {};
  const ssize_t length = pread(file, start, sizeof start, 0);
  const std::string_view magic(start, length < 0 ? 0 : static_cast<std::size_t>(length));
  if (magic == "PK\5\6") return installerError(InstallerFailure::noApp, "the package is empty; pack an app folder");
  if (magic == "PK\3\4") {
    return installerError(InstallerFailure::damaged, "the package is truncated or damaged; copy it again");
  }
  return installerError(InstallerFailure::notAPackage,
                        "this is not a package; a package is a zip archive of an app folder");
}

}  // namespace

void PackageReader::Closer::operator()(archive* reader) const noexcept {
  archive_read_free(reader);
}

Result<PackageReader> PackageReader::open(FileDescriptor file, PackageLimits limits) {
  struct stat status {};
  if (fstat(file.get(), &status) != 0) return Error::fromErrno(errno, "package");
  if (!S_ISREG(status.st_mode)) {
    return installerError(InstallerFailure::notAPackage, "this is not a package; a package is a file");
  }
  const NamesAreUTF8 names;
  PackageReader package;
  package.file_ = std::move(file);
  package.limits_ = limits;
  package.packageBytes_ = static_cast<std::uint64_t>(status.st_size);
  package.reader_.reset(archive_read_new());
  archive* reader = package.reader_.get();
  if (reader == nullptr) return Error::fromErrno(ENOMEM, "package");
  archive_read_support_format_zip_seekable(reader);
  archive_read_set_format_option(reader, "zip", "hdrcharset", "UTF-8");
  if (archive_read_open_fd(reader, package.file_.get(), kReadSize) != ARCHIVE_OK) {
    return notOpened(package.file_.get());
  }
  return package;
}

Error PackageReader::failure() const {
  const char* reason = archive_error_string(reader_.get());
  const int error = archive_errno(reader_.get());
  if (error > 0 && error != EINVAL && error != EILSEQ) return Error::fromErrno(error, "package");
  std::string text = "the package is damaged";
  if (!current_.empty()) text += " at " + quoted(current_);
  if (reason != nullptr) text += std::string(": ") + reason;
  return installerError(InstallerFailure::damaged, text + "; copy it again");
}

Result<bool> PackageReader::next(Entry& entry) {
  const NamesAreUTF8 names;
  archive_entry* header = nullptr;
  const int result = archive_read_next_header(reader_.get(), &header);
  if (result == ARCHIVE_EOF) return false;
  if (result != ARCHIVE_OK) return failure();
  const char* name = archive_entry_pathname(header);
  if (name == nullptr) {
    return installerError(InstallerFailure::unsafeEntry,
                          "the package has a name that is not UTF-8" + std::string(kMakeAgain));
  }
  const auto type = archive_entry_filetype(header);
  entry.path = name;
  entry.kind = type == AE_IFDIR ? Kind::folder : Kind::file;
  entry.executable = (archive_entry_perm(header) & 0111) != 0;
  if (entry.kind == Kind::folder && entry.path.ends_with('/')) entry.path.pop_back();
  current_ = entry.path;
  const bool isLink = archive_entry_hardlink(header) != nullptr || type == AE_IFLNK;
  if (isLink || (type != AE_IFREG && type != AE_IFDIR)) {
    return installerError(InstallerFailure::unsafeEntry, "the package holds " + quoted(current_) + ", which is a " +
                                                             (isLink ? "link" : "device") +
                                                             "; pack files and folders only");
  }
  if (archive_entry_is_encrypted(header) != 0) {
    return installerError(InstallerFailure::encrypted,
                          "the package is encrypted at " + quoted(current_) + "; make it again without a password");
  }
  RETURN_IF_ERROR(check(entry));
  if (archive_entry_size_is_set(header) != 0) {
    const auto size = static_cast<std::uint64_t>(std::max<la_int64_t>(archive_entry_size(header), 0));
    if (size > limits_.unpackedBytes - unpackedBytes_) return tooLarge();
  }
  return true;
}

Status PackageReader::check(const Entry& entry) {
  if (++entries_ > limits_.entries) {
    return installerError(InstallerFailure::tooLarge, "the package has more than " + std::to_string(limits_.entries) +
                                                          " entries, the most that are allowed; make the app smaller");
  }
  if (!isPlainPath(entry.path)) {
    return installerError(
        InstallerFailure::unsafeEntry,
        "the package holds " + quoted(entry.path) + ", a name that may lead outside it" + std::string(kMakeAgain));
  }
  RETURN_IF_ERROR(checkPlace(entry.path, entry.kind));
  if (!seen_.insert(entry.path).second) {
    return installerError(InstallerFailure::duplicateEntry,
                          "the package holds " + quoted(entry.path) + " twice" + std::string(kMakeAgain));
  }
  return {};
}

Status PackageReader::checkPlace(std::string_view path, Kind kind) {
  const std::string_view top = path.substr(0, path.find('/'));
  if (isAppFolder(top) && (kind == Kind::folder || top.size() < path.size())) {
    if (appFolder_.empty()) appFolder_ = top;
    if (appFolder_ == top) return {};
    return installerError(InstallerFailure::severalApps, "the package holds two apps, " + quoted(appFolder_) + " and " +
                                                             quoted(top) + "; make a package of each");
  }
  if (kind == Kind::file && (path == kStoreMetadataName || path == kArtworkName)) return {};
  return installerError(InstallerFailure::strayEntry,
                        "the package holds " + quoted(path) + ", which belongs to no app; take it out of the package");
}

Error PackageReader::tooLarge() const {
  return installerError(InstallerFailure::tooLarge, "the package unpacks to more than " +
                                                        std::to_string(limits_.unpackedBytes) +
                                                        " bytes, the most that are allowed; make the app smaller");
}

Result<bool> PackageReader::nextBlock(Block& block) {
  const void* bytes = nullptr;
  std::size_t size = 0;
  la_int64_t offset = 0;
  const int result = archive_read_data_block(reader_.get(), &bytes, &size, &offset);
  if (result == ARCHIVE_EOF) return false;
  if (result != ARCHIVE_OK) return failure();
  unpackedBytes_ += size;
  if (unpackedBytes_ > limits_.unpackedBytes) return tooLarge();
  if (unpackedBytes_ > limits_.freeBytes && unpackedBytes_ / limits_.ratio > packageBytes_) {
    return installerError(InstallerFailure::tooLarge,
                          "the package unpacks to more than " + std::to_string(limits_.ratio) +
                              " times its size, the most that is allowed; no app does that");
  }
  block = {{static_cast<const std::byte*>(bytes), size}, offset};
  return true;
}

double PackageReader::fraction() const {
  if (packageBytes_ == 0) return 1;
  const auto consumed = static_cast<double>(archive_filter_bytes(reader_.get(), -1));
  return std::clamp(consumed / static_cast<double>(packageBytes_), 0.0, 1.0);
}

Result<Bytes> PackageReader::readAll(std::uint64_t most) {
  Bytes all;
  Block block;
  for (;;) {
    const Result<bool> more = nextBlock(block);
    if (!more) return more.error();
    if (!*more) return all;
    const std::uint64_t end = static_cast<std::uint64_t>(block.offset) + block.bytes.size();
    if (block.offset < 0 || end > most) {
      return installerError(InstallerFailure::tooLarge, "the package's " + quoted(current_) + " has more than " +
                                                            std::to_string(most) + " bytes, the most that are allowed");
    }
    all.insert(all.end(), block.bytes.begin(), block.bytes.end());
  }
}

}  // namespace appsync::device
