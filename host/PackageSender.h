// The host's side of a transfer: sends packages to the device.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "base/Error.h"
#include "device/storage/DeviceFileSystem.h"
#include "host/Library.h"

namespace appsync::host {

/// Links or copies packages into the device. Copies are made in pieces, in the kernel if possible, so memory does not
/// depend on the package's size. Not thread-safe.
class PackageSender {
 public:
  /// Receives the fraction of the package that was sent, from 0 to 1. Returning false cancels the transfer.
  using GoOn = std::function<bool(double fraction)>;

  explicit PackageSender(device::DeviceFileSystem& files) : files_(files) {}

  /// Puts the package into the public staging folder under a unique name and returns its path relative to that folder.
  /// On the library's own file system the name is a hard link to the library's file, elsewhere the file is copied. A
  /// failed or cancelled transfer leaves nothing behind. Errors: "POSIX"; ECANCELED if `goOn` returned false.
  [[nodiscard]] Result<std::string> send(const LibraryPackage& package, const GoOn& goOn);

 private:
  device::DeviceFileSystem& files_;
  std::uint64_t sent_ = 0;
};

}  // namespace appsync::host
