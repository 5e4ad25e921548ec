// The layout of a device's directory.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/storage/Access.h"
#include "device/storage/DeviceFileSystem.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::device {

inline constexpr const char* kDatabaseFile = "device.db";
/// The name of an incomplete database.
inline constexpr const char* kNewDatabaseFile = "device.db.new";
inline constexpr const char* kRootDirectory = "root";
inline constexpr const char* kWorkDirectory = "work";
inline constexpr const char* kLockFile = "lock";

/// Checks that a directory is empty or contains only the files of an interrupted attempt to create a device. Fails with
/// an error of kDeviceDomain otherwise.
[[nodiscard]] Status checkDirectoryIsFree(const std::string& path, int folder);

/// Locks a device until the descriptor is closed. Fails with an error that names the holder if another process has the
/// lock.
[[nodiscard]] Result<FileDescriptor> lockDevice(const std::string& path, int folder);

/// Creates the mandatory directories, unless an interrupted attempt has created them.
[[nodiscard]] Status makeDeviceDirectories(const std::string& path, int folder);

/// Opens the file system and, with exclusive access, creates missing optional directories. Fails with
/// `DeviceFailure::damaged` if the root or the containers are missing.
[[nodiscard]] Result<DeviceFileSystem> openFileSystem(const std::string& path, int folder, Access access);

}  // namespace appsync::device
