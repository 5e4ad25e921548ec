// Device paths to open files, without a way out of the device.
#pragma once

#include <string>
#include <string_view>

#include <sys/types.h>

#include "base/Error.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::device {

/// Who takes a path apart: the kernel in one call, where it can, or this process, one component after the other.
enum class Resolution { kernel, componentwise };

/// The folder that is a device's "/". Whatever a path or the links on its way say, and however they change meanwhile,
/// nothing outside is opened: ".." above the root and absolute links fail.
///
/// Threads: any. Errors: POSIX; EXDEV for a path that leads out. The text starts with the path.
class RootDirectory {
 public:
  [[nodiscard]] static Result<RootDirectory> open(const std::string& hostPath,
                                                  Resolution resolution = Resolution::kernel);

  /// Opens what is at an absolute device path, as open(2) does.
  [[nodiscard]] Result<FileDescriptor> open(std::string_view path, int flags) const;

  /// What is to be made, moved or removed: a name in an open folder. The name is a single component, neither "." nor
  /// "..".
  struct Place {
    FileDescriptor folder;
    std::string name;
  };
  /// The place of an absolute device path; the folder must exist, what is in it by that name need not.
  [[nodiscard]] Result<Place> place(std::string_view path) const;

 private:
  RootDirectory(FileDescriptor root, Resolution resolution) : root_(std::move(root)), resolution_(resolution) {}

  [[nodiscard]] Result<FileDescriptor> resolve(std::string_view whole, std::string_view path, int flags) const;

  FileDescriptor root_;
  Resolution resolution_;
};

/// The same below any open folder, for a relative path: 0, or the error number.
[[nodiscard]] int openBeneath(int folder, const std::string& path, int flags, mode_t mode, Resolution resolution,
                              FileDescriptor& file);

}  // namespace appsync::device
