// The layout of a device's directory.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/storage/Access.h"
#include "device/storage/DeviceFileSystem.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::device {

inline constexpr const char* kDatabaseFile = "device.db";
/// A database under this name is still being made.
inline constexpr const char* kNewDatabaseFile = "device.db.new";
inline constexpr const char* kRootDirectory = "root";
inline constexpr const char* kWorkDirectory = "work";
inline constexpr const char* kLockFile = "lock";

/// Whether a folder can become a device: it is empty, or holds what an interrupted attempt left. Else an error of
/// kDeviceDomain.
[[nodiscard]] Status checkDirectoryIsFree(const std::string& path, int folder);

/// Takes hold of a device until the descriptor is closed; an error that names the holder when another process has it.
[[nodiscard]] Result<FileDescriptor> lockDevice(const std::string& path, int folder);

/// Makes the folders without which a device is damaged, where an interrupted attempt has not made them.
[[nodiscard]] Status makeDeviceDirectories(const std::string& path, int folder);

/// Makes what may be missing, if `access` allows it; a device without its root or containers is damaged.
[[nodiscard]] Result<DeviceFileSystem> openFileSystem(const std::string& path, int folder, Access access);

}  // namespace appsync::device
