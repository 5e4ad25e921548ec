// The folders that bundles are installed in.
#pragma once

#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/storage/DeviceFileSystem.h"
#include "device/storage/Durability.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::device {

/// A container that is being filled, under a name that says so. Unless it is settled and kept, its end removes it.
class PendingContainer {
 public:
  [[nodiscard]] static Result<PendingContainer> make(DeviceFileSystem& files);
  PendingContainer(PendingContainer&&) = default;
  PendingContainer& operator=(PendingContainer&&) = delete;
  ~PendingContainer();

  /// The container's open folder.
  [[nodiscard]] int folder() const noexcept { return folder_.get(); }
  /// The name it has once it is settled.
  [[nodiscard]] const std::string& name() const noexcept { return name_; }

  /// Makes a file of it, in place of one that is there.
  [[nodiscard]] Status writeFile(std::string_view name, ByteView bytes);
  /// Gives it its name; with `Durability::power` the name and all in it are on the disk then.
  [[nodiscard]] Status commit(Durability durability);
  /// It belongs to a record now.
  void release() noexcept { released_ = true; }

 private:
  PendingContainer(DeviceFileSystem& files, FileDescriptor parent);

  DeviceFileSystem* files_;
  FileDescriptor parent_;
  FileDescriptor folder_;
  std::string name_;
  std::string nameNow_;
  bool released_ = false;
};

/// Removes a container that no record has any more. What cannot be removed is left to the next opening of the device.
void removeContainer(DeviceFileSystem& files, const std::string& name);

}  // namespace appsync::device
