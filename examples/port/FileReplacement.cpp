#include "FileReplacement.h"

#include <cerrno>
#include <cstdio>
#include <filesystem>

#include <fcntl.h>
#include <unistd.h>

namespace port {

namespace {

int writeAll(int file, std::string_view text) {
  while (!text.empty()) {
    const ssize_t written = write(file, text.data(), text.size());
    if (written < 0 && errno == EINTR) continue;
    if (written < 0) return errno;
    text.remove_prefix(static_cast<std::size_t>(written));
  }
  return fsync(file) == 0 ? 0 : errno;
}

/// Makes a rename durable, which requires an fsync of the directory. Not every file system supports it, and the file is
/// already replaced, so errors are ignored.
void syncDirectoryOf(const std::string& path) {
  const std::string directory = std::filesystem::path(path).parent_path().string();
  const int file = open(directory.empty() ? "." : directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (file < 0) return;
  static_cast<void>(fsync(file));
  close(file);
}

}  // namespace

int replaceFile(const std::string& path, std::string_view text) {
  const std::string fresh = path + ".new";
  const int file = open(fresh.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
  if (file < 0) return errno;
  int error = writeAll(file, text);
  close(file);
  if (error == 0 && std::rename(fresh.c_str(), path.c_str()) != 0) error = errno;
  if (error != 0) {
    unlink(fresh.c_str());
    return error;
  }
  syncDirectoryOf(path);
  return 0;
}

}  // namespace port
