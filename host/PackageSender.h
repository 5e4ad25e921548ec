// The host's side of a transfer: a package's way onto the device.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "base/Error.h"
#include "device/storage/DeviceFileSystem.h"
#include "host/Library.h"

namespace appsync::host {

/// Copies packages onto the device piece by piece, within the kernel where it can; memory does not grow with a package.
/// One thread at a time.
class PackageSender {
 public:
  /// Hears how much of the package is there, from 0 to 1; false ends the transfer.
  using GoOn = std::function<bool(double fraction)>;

  explicit PackageSender(device::DeviceFileSystem& files) : files_(files) {}

  /// Puts the package into the public staging folder under a name of its own, and returns its path relative to that
  /// folder. On the library's own file system it is the library's file under a second name, for which no time is
  /// needed; elsewhere a copy. A failed or ended transfer leaves nothing behind. Errors: "POSIX"; ECANCELED when `goOn`
  /// ended it.
  [[nodiscard]] Result<std::string> send(const LibraryPackage& package, const GoOn& goOn);

 private:
  device::DeviceFileSystem& files_;
  std::uint64_t sent_ = 0;
};

}  // namespace appsync::host
