// The part of the device's file system that sync clients use.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::platform {

/// Owner and group of a new file or directory, and of parents that are created with it. nullopt means the owner or
/// group of the creating process.
struct OwnerAttributes {
  std::optional<std::string> ownerAccountName;
  std::optional<std::string> groupOwnerAccountName;
  bool operator==(const OwnerAttributes&) const = default;
};

/// Whether missing parent directories are created as well.
enum class IntermediateDirectories { create, require };

struct FileAttributes {
  std::uint64_t size = 0;  ///< bytes; 0 for a directory
  bool isDirectory = false;
};

/// Files and directories by absolute device path ("/var/mobile/…"). A path that leaves the device's file system,
/// through ".." or symbolic links, fails.
///
/// Thread-safe. Concurrent writes to one path do not mix: the file holds the bytes of one of them. Errors: domain
/// "POSIX" with the system's error number; the text names the path. Unless stated otherwise, a failed operation changes
/// nothing.
class FileSystem {
 public:
  virtual ~FileSystem() = default;

  /// Returns true for files, directories, and symbolic links whose target exists.
  [[nodiscard]] virtual bool fileExists(std::string_view path) = 0;

  /// Returns size and kind of the item at `path`; follows symbolic links. Fails with ENOENT if it does not exist.
  [[nodiscard]] virtual Result<FileAttributes> attributesOfItem(std::string_view path) = 0;

  /// Returns the contents of a file. Fails for directories.
  [[nodiscard]] virtual Result<Bytes> readFile(std::string_view path) = 0;

  /// Creates or replaces the file at `path`, whose parent must exist. Atomic for readers, and across crashes and power
  /// failures: the file has either the old or the new contents.
  [[nodiscard]] virtual Status writeFileAtomically(std::string_view path, ByteView bytes) = 0;

  /// Creates or replaces the file at `path`, whose parent must exist, with these contents and owners.
  [[nodiscard]] virtual Status createFile(std::string_view path, ByteView bytes, const OwnerAttributes& attributes) = 0;

  /// Creates a directory. With `IntermediateDirectories::create`, an existing directory is a success and keeps its
  /// owners; parents that were created remain after a failure. With `require`, an existing directory is an error.
  [[nodiscard]] virtual Status createDirectory(std::string_view path, IntermediateDirectories intermediates,
                                               const OwnerAttributes& attributes) = 0;

  /// Copies a file, or a directory with its contents, to `to`, whose parent must exist. Fails with EEXIST if `to`
  /// exists; `to` is then unchanged. Removes an incomplete copy.
  [[nodiscard]] virtual Status copyItem(std::string_view from, std::string_view to) = 0;

  /// Moves a file or directory to `to`, whose parent must exist. Atomic: the item is complete at either `from` or `to`.
  /// Fails if `to` exists; `to` is then unchanged.
  [[nodiscard]] virtual Status moveItem(std::string_view from, std::string_view to) = 0;

  /// Removes a file, a symbolic link (not its target), or a directory with its contents. Fails with ENOENT if nothing
  /// is at `path`. If removing a directory fails, part of its contents may remain.
  [[nodiscard]] virtual Status removeItem(std::string_view path) = 0;

  /// Sets the times of last access and modification to the current time. The error's text is the system's message.
  [[nodiscard]] virtual Status touch(std::string_view path) = 0;

  /// Returns an existing directory for temporary files of this process, without a trailing slash. The system may empty
  /// it while the process is not running.
  [[nodiscard]] virtual std::string temporaryDirectory() = 0;
};

}  // namespace appsync::platform
