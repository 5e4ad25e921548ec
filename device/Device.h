// The embedded device, stored in a directory.
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

/// How a device installs the packages of a sync: through install coordination, or directly by the sync client.
enum class InstallMode { coordinated, direct };

/// DEVICE/root is the device's file-system root, DEVICE/device.db the database of everything else, DEVICE/lock names
/// the process with exclusive access, and DEVICE/work contains incomplete files, which may be deleted.
///
/// Thread-safe, except that no call may be running during destruction.
class Device {
 public:
  /// Creates a device in a missing or empty directory, whose parent must exist. A failure or crash leaves nothing, or a
  /// directory that `create` accepts again. `mode` sets the initial value of the setting "coordination".
  [[nodiscard]] static Result<std::unique_ptr<Device>> create(const std::string& path,
                                                              InstallMode mode = InstallMode::direct);

  /// Opens a device. `exclusive` locks it until destruction and recovers from crashes; it may be interrupted and
  /// repeated. `readOnly` reads the device as it is, also while another process has exclusive access.
  [[nodiscard]] static Result<std::unique_ptr<Device>> open(const std::string& path, Access access);

  Device(const Device&) = delete;
  Device& operator=(const Device&) = delete;

  /// The services of this device, valid until the device is destroyed.
  [[nodiscard]] platform::Platform& platform() noexcept { return services_; }
  /// The same services with their concrete types, including the operations for tools.
  [[nodiscard]] Services& services() noexcept { return services_; }

  /// The host path passed to `create` or `open`.
  [[nodiscard]] const std::string& path() const noexcept { return path_; }

 private:
  Device(std::string path, FileDescriptor lock, std::unique_ptr<Database> database, DeviceFileSystem files,
         Access access);

  /// Opens a device for which `lock` was acquired, or without a lock for `readOnly`.
  [[nodiscard]] static Result<std::unique_ptr<Device>> open(const std::string& path, Access access,
                                                            FileDescriptor lock);

  const std::string path_;
  FileDescriptor lock_;
  std::unique_ptr<Database> database_;
  DeviceFileSystem files_;
  Services services_;
};

}  // namespace appsync::device
