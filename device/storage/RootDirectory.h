// Opens device paths without leaving the device.
#pragma once

#include <string>
#include <string_view>

#include <sys/types.h>

#include "base/Error.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::device {

/// How paths are resolved: by openat2 if the kernel has it, or one component after the other.
enum class Resolution { kernel, componentwise };

/// The directory that is a device's "/". Paths are untrusted: ".." above the root and absolute links fail, and
/// concurrent changes of the tree never lead outside.
///
/// Thread-safe. Errors are of domain "POSIX", EXDEV for a path that leads outside; their text starts with the path.
class RootDirectory {
 public:
  [[nodiscard]] static Result<RootDirectory> open(const std::string& hostPath,
                                                  Resolution resolution = Resolution::kernel);

  /// Opens an absolute device path with the flags of open(2).
  [[nodiscard]] Result<FileDescriptor> open(std::string_view path, int flags) const;

  /// A directory entry to create, move or remove. The name is a single component, neither "." nor "..".
  struct Place {
    FileDescriptor folder;
    std::string name;
  };
  /// Resolves an absolute device path. The directory must exist, the entry need not.
  [[nodiscard]] Result<Place> place(std::string_view path) const;

 private:
  RootDirectory(FileDescriptor root, Resolution resolution) : root_(std::move(root)), resolution_(resolution) {}

  [[nodiscard]] Result<FileDescriptor> resolve(std::string_view whole, std::string_view path, int flags) const;

  FileDescriptor root_;
  Resolution resolution_;
};

/// Opens a relative path below any open directory in the same way. Returns 0 or an errno value.
[[nodiscard]] int openBeneath(int folder, const std::string& path, int flags, mode_t mode, Resolution resolution,
                              FileDescriptor& file);

}  // namespace appsync::device
