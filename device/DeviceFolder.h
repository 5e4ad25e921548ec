// The layout of a device's directory.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/Access.h"
#include "device/DeviceFileSystem.h"
#include "device/FileDescriptor.h"

namespace appsync::device {

inline constexpr const char* kDatabaseFile = "device.db";
/// A database under this name is still being made.
inline constexpr const char* kNewDatabaseFile = "device.db.new";
inline constexpr const char* kRootFolder = "root";
inline constexpr const char* kWorkFolder = "work";
inline constexpr const char* kLockFile = "lock";

/// Whether a folder can become a device: it is empty, or holds what an interrupted attempt left. Else an error of
/// kDeviceDomain.
[[nodiscard]] Status checkFolderIsFree(const std::string& path, int folder);

/// Takes hold of a device until the descriptor is closed; an error that names the holder when another process has it.
[[nodiscard]] Result<FileDescriptor> lockDevice(const std::string& path, int folder);

/// Makes those folders of a device that are not there.
[[nodiscard]] Status makeDeviceFolders(int folder);

[[nodiscard]] Result<DeviceFileSystem> openFileSystem(const std::string& path, int folder, Access access);

}  // namespace appsync::device
