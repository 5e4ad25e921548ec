// The containers of bundles.
#pragma once

#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/storage/DeviceFileSystem.h"
#include "device/storage/Durability.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::device {

/// A new container under a temporary name. The destructor removes it unless `release` was called.
class PendingContainer {
 public:
  [[nodiscard]] static Result<PendingContainer> make(DeviceFileSystem& files);
  PendingContainer(PendingContainer&&) = default;
  PendingContainer& operator=(PendingContainer&&) = delete;
  ~PendingContainer();

  /// The container's open directory.
  [[nodiscard]] int folder() const noexcept { return folder_.get(); }
  /// The name after `commit`.
  [[nodiscard]] const std::string& name() const noexcept { return name_; }

  /// Creates or replaces a file of the container.
  [[nodiscard]] Status writeFile(std::string_view name, ByteView bytes);
  /// Renames the container to its final name and makes it durable as requested.
  [[nodiscard]] Status commit(Durability durability);
  /// Keeps the container, which a record now owns.
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

/// Removes a container without a record. After a failure the next opening of the device removes it.
void removeContainer(DeviceFileSystem& files, const std::string& name);

}  // namespace appsync::device
