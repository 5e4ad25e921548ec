// The device's file system, as far as sync clients use it.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::platform {

/// The accounts that a new file or folder, with the parents made on the way to it, is to belong to. An absent name
/// leaves the creating process's own.
struct OwnerAttributes {
  std::optional<std::string> ownerAccountName;
  std::optional<std::string> groupOwnerAccountName;
  bool operator==(const OwnerAttributes&) const = default;
};

/// Whether missing parent folders are made as well.
enum class IntermediateDirectories { create, require };

/// What is known of an existing file.
struct FileAttributes {
  std::uint64_t size = 0;  ///< bytes; 0 for a folder
  bool isDirectory = false;
};

/// Files and folders by absolute device path ("/var/mobile/…"). No operation reaches anything outside the device's file
/// system, whatever the path or the links in it say: such a path fails.
///
/// Threads: every operation may be called from any thread at any time. Two writers of one path do not mix: the file
/// holds what one of them wrote.
/// Errors: domain "POSIX" with the system's number wherever a number fits; the text names the path.
/// Failure: unless an operation says otherwise, a failed one leaves everything as it was.
class FileSystem {
 public:
  virtual ~FileSystem() = default;

  /// True for files, folders and links that lead to something.
  [[nodiscard]] virtual bool fileExists(std::string_view path) = 0;

  /// The size and kind of what is at `path`, links followed.
  [[nodiscard]] virtual Result<FileAttributes> attributesOfItem(std::string_view path) = 0;

  /// The whole of a file, read in one go. Folders fail.
  [[nodiscard]] virtual Result<Bytes> readFile(std::string_view path) = 0;

  /// Replaces the file at `path`, or makes it; the parent must exist. A reader, or a device that lost power, finds the
  /// old bytes or the new, never a mixture and never nothing.
  [[nodiscard]] virtual Status writeFileAtomically(std::string_view path, ByteView bytes) = 0;

  /// Makes a file with these bytes and owners; a file already there is replaced, the parent must exist.
  [[nodiscard]] virtual Status createFile(std::string_view path, ByteView bytes, const OwnerAttributes& attributes) = 0;

  /// Makes a folder. With `IntermediateDirectories::create` a folder already there is a success and keeps its owners,
  /// and parents made on the way stay when a later one fails; with `require` an existing one is a failure.
  [[nodiscard]] virtual Status createDirectory(std::string_view path, IntermediateDirectories intermediates,
                                               const OwnerAttributes& attributes) = 0;

  /// Copies a file, or a folder with all that is in it; the parent of `to` must exist. Something already at `to` stays,
  /// and the copy fails with EEXIST. A copy that fails midway is removed.
  [[nodiscard]] virtual Status copyItem(std::string_view from, std::string_view to) = 0;

  /// Moves a file or folder in one step: at any moment it is whole at `from` or whole at `to`, whose parent must exist.
  /// Something already at `to` is a failure, and stays.
  [[nodiscard]] virtual Status moveItem(std::string_view from, std::string_view to) = 0;

  /// Removes a file, a link (not what it leads to) or a folder with all that is in it. Nothing there is a failure. A
  /// folder's removal that fails midway leaves the rest.
  [[nodiscard]] virtual Status removeItem(std::string_view path) = 0;

  /// Sets the times of last access and modification to now. The error's text is the system's own words.
  [[nodiscard]] virtual Status touch(std::string_view path) = 0;

  /// An existing folder for short-lived files of this process, without a slash at its end. The system may empty it
  /// whenever the process does not run.
  [[nodiscard]] virtual std::string temporaryDirectory() = 0;
};

}  // namespace appsync::platform
