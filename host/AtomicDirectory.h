// A directory of this machine that is created atomically.
#pragma once

#include <filesystem>
#include <string>

#include "base/Error.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::host {

/// A directory that is filled under a hidden name, ".NAME.partial", and appears under its name only when it is
/// published. The destructor removes an unpublished one; after a crash the next one for the same path does.
class AtomicDirectory {
 public:
  /// Fails if `path` exists, if its parent does not exist, if another process is creating the same directory, and if
  /// anything else has the hidden name, which is then left as it is. Errors: "POSIX"; the text says what to do.
  [[nodiscard]] static Result<AtomicDirectory> make(const std::string& path);
  AtomicDirectory(AtomicDirectory&&) = default;
  AtomicDirectory& operator=(AtomicDirectory&&) = delete;
  ~AtomicDirectory();

  /// Returns the file descriptor of the directory to fill.
  [[nodiscard]] int folder() const noexcept { return folder_.get(); }

  /// Returns the path of that directory until it is published.
  [[nodiscard]] std::string folderPath() const;

  /// Makes the content durable and renames the directory to its path. Fails if the path exists by now.
  [[nodiscard]] Status publish();

 private:
  AtomicDirectory(std::string path, const std::filesystem::path& place, device::FileDescriptor parent);
  [[nodiscard]] Status open();
  /// Opens and locks the hidden directory and creates it if it is missing. Returns false if it was removed or replaced
  /// before it could be locked.
  [[nodiscard]] Result<bool> lockHidden();

  std::string path_;
  std::string name_;
  std::string hiddenName_;
  std::string hiddenPath_;
  device::FileDescriptor parent_;
  /// The hidden directory, which is locked, and the directory in it that is published.
  device::FileDescriptor hidden_;
  device::FileDescriptor folder_;
};

}  // namespace appsync::host
