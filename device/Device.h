// The embedded device: a directory that is a whole device.
#pragma once

#include <memory>
#include <string>

#include "base/Error.h"
#include "device/DeviceError.h"
#include "device/Services.h"
#include "device/storage/Access.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"
#include "device/storage/FileDescriptor.h"
#include "platform/Platform.h"

namespace appsync::device {

/// How a device installs what a sync brings: through coordinators, or the sync client does it itself.
enum class InstallMode { coordinated, direct };

/// DEVICE/root is the device's file-system root, DEVICE/device.db holds everything else, DEVICE/lock names the process
/// that holds the device, and DEVICE/work is for what is half done; the device is whole without what is in it.
///
/// Threads: any, but for destruction, when no other call may be under way.
class Device {
 public:
  /// Makes a device of a missing or empty folder, whose parent must exist. A failure, or a kill, leaves nothing or a
  /// folder that `create` takes again. The mode becomes the setting "coordination", which can be changed.
  [[nodiscard]] static Result<std::unique_ptr<Device>> create(const std::string& path,
                                                              InstallMode mode = InstallMode::direct);

  /// Opens a device. `exclusive` takes hold of it until the object's end, and puts in order what a crash left half
  /// done: it may be interrupted and tried again at will. `readOnly` sees the device as it is, beside a process that
  /// holds it too.
  [[nodiscard]] static Result<std::unique_ptr<Device>> open(const std::string& path, Access access);

  Device(const Device&) = delete;
  Device& operator=(const Device&) = delete;

  /// Every service of this device. Lives as long as the device.
  [[nodiscard]] platform::Platform& platform() noexcept { return services_; }
  /// The same services as what they are here, with what only tools need.
  [[nodiscard]] Services& services() noexcept { return services_; }

  /// The host path it was opened with.
  [[nodiscard]] const std::string& path() const noexcept { return path_; }

 private:
  Device(std::string path, FileDescriptor lock, std::unique_ptr<Database> database, DeviceFileSystem files,
         Access access);

  /// Opens a device that this process holds, or only reads.
  [[nodiscard]] static Result<std::unique_ptr<Device>> open(const std::string& path, Access access,
                                                            FileDescriptor lock);

  const std::string path_;
  FileDescriptor lock_;
  std::unique_ptr<Database> database_;
  DeviceFileSystem files_;
  Services services_;
};

}  // namespace appsync::device
