#include "device/packages/PackageWriter.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <filesystem>
#include <memory>

#include <archive.h>
#include <archive_entry.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "base/ReturnIfError.h"
#include "device/packages/Package.h"
#include "device/storage/FileDescriptor.h"
#include "device/storage/HostFile.h"

namespace appsync::device {
namespace {

namespace fs = std::filesystem;

struct Item {
  std::string name;  // in the package, folders with a slash at the end
  std::string path;
  bool operator<(const Item& other) const { return name < other.name; }
};

struct WriterEnd {
  void operator()(archive* writer) const { archive_write_free(writer); }
};
using Writer = std::unique_ptr<archive, WriterEnd>;

struct EntryEnd {
  void operator()(archive_entry* entry) const { archive_entry_free(entry); }
};
using Entry = std::unique_ptr<archive_entry, EntryEnd>;

Error refused(const std::string& path, const char* reason) {
  return {std::string(domains::kPOSIX), EINVAL, path + " " + reason, nullptr};
}

Error failed(const Writer& writer, const std::string& path) {
  const int error = archive_errno(writer.get());
  const char* text = archive_error_string(writer.get());
  return Error::fromErrno(error > 0 ? error : EIO,
                          path + " cannot be packed" + (text ? ": " : "") + (text ? text : ""));
}

/// Adds `path` and, if it is a folder, everything below it.
Status collect(const fs::path& path, const std::string& name, std::vector<Item>& items) {
  std::error_code failure;
  const fs::file_status status = fs::symlink_status(path, failure);
  if (failure) return Error::fromErrno(failure.value(), path.string() + " cannot be read");
  if (fs::is_symlink(status)) return refused(path.string(), "is a link; put the file itself into the app");
  if (fs::is_regular_file(status)) {
    items.push_back({name, path.string()});
    return {};
  }
  if (!fs::is_directory(status))
    return refused(path.string(), "is neither a file nor a folder; leave it out of the app");
  items.push_back({name + "/", path.string()});
  fs::directory_iterator children(path, failure);
  for (; !failure && children != fs::directory_iterator(); children.increment(failure)) {
    RETURN_IF_ERROR(collect(children->path(), name + "/" + children->path().filename().string(), items));
  }
  if (failure) return Error::fromErrno(failure.value(), path.string() + " cannot be read");
  return {};
}

Status writeContent(const Writer& writer, const FileDescriptor& file, std::int64_t size, const std::string& path) {
  std::array<char, std::size_t{128} * 1024> block;
  while (size > 0) {
    const auto most = std::min(block.size(), static_cast<std::size_t>(size));
    const ssize_t count = ::read(file.get(), block.data(), most);
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) return Error::fromErrno(errno, path + " cannot be read");
    if (count == 0) return refused(path, "became shorter while it was being packed; try again");
    if (archive_write_data(writer.get(), block.data(), static_cast<std::size_t>(count)) < 0)
      return failed(writer, path);
    size -= count;
  }
  return {};
}

/// Entries have no time: libarchive then writes the format's earliest, regardless of the time zone.
Status writeItem(const Writer& writer, const Item& item) {
  const bool isFolder = item.name.back() == '/';
  const FileDescriptor file(::open(item.path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
  struct stat found = {};
  if (file.get() < 0 || ::fstat(file.get(), &found) != 0) {
    return Error::fromErrno(errno, item.path + " cannot be read");
  }
  const Entry entry(archive_entry_new());
  if (archive_entry_update_pathname_utf8(entry.get(), item.name.c_str()) == 0) {
    return refused(item.path, "has a name that is not UTF-8; rename it");
  }
  archive_entry_set_filetype(entry.get(), isFolder ? AE_IFDIR : AE_IFREG);
  archive_entry_set_perm(entry.get(), isFolder || (found.st_mode & S_IXUSR) != 0 ? 0755 : 0644);
  if (!isFolder) archive_entry_set_size(entry.get(), found.st_size);
  if (archive_write_header(writer.get(), entry.get()) != ARCHIVE_OK) return failed(writer, item.path);
  return isFolder ? Status() : writeContent(writer, file, found.st_size, item.path);
}

Status writeItems(const std::vector<Item>& items, int file, const std::string& package) {
  const Writer writer(archive_write_new());
  if (archive_write_set_format_zip(writer.get()) != ARCHIVE_OK ||
      archive_write_set_options(writer.get(), "zip:compression=deflate,zip:hdrcharset=UTF-8") != ARCHIVE_OK ||
      archive_write_open_fd(writer.get(), file) != ARCHIVE_OK) {
    return failed(writer, package);
  }
  for (const Item& item : items) {
    RETURN_IF_ERROR(writeItem(writer, item));
  }
  if (archive_write_close(writer.get()) != ARCHIVE_OK) return failed(writer, package);
  return {};
}

/// Rejects a package that no device would install because of its names or size.
Status check(int file, const std::string& package) {
  const std::string draft = "/proc/self/fd/" + std::to_string(file);
  const Result<PackageInfo> info = readPackageInfo(draft);
  if (info) return {};
  Error error = info.error();
  if (error.text.starts_with(draft)) error.text.replace(0, draft.size(), package);
  return error;
}

}  // namespace

Status writePackage(const std::vector<std::string>& items, const std::string& package) {
  std::vector<Item> all;
  for (const std::string& item : items) {
    const fs::path path = fs::path(item).has_filename() ? fs::path(item) : fs::path(item).parent_path();
    RETURN_IF_ERROR(collect(path, path.filename().string(), all));
  }
  std::sort(all.begin(), all.end());
  return writeHostFile(package, [&](int file) -> Status {
    RETURN_IF_ERROR(writeItems(all, file, package));
    return check(file, package);
  });
}

}  // namespace appsync::device
