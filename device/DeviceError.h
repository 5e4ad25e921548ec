// Errors of creating and opening devices.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/storage/Access.h"

namespace appsync::device {

/// Error domain of `Device::create` and `Device::open`.
inline constexpr std::string_view kDeviceDomain = "Device";

/// The codes of errors in kDeviceDomain. Each text names the problem and a remedy.
enum class DeviceFailure : long {
  missing = 1,    ///< the directory does not exist
  notADevice,     ///< a directory or file that is not a device
  exists,         ///< `create` in a directory that is not empty
  damaged,        ///< the database or part of the directory cannot be read
  otherVersion,   ///< created by an incompatible version of this program
  noSpace,        ///< the disk is full
  readOnly,       ///< the directory or its file system is not writable
  held,           ///< another process has exclusive access
  notAccessible,  ///< any other failure of the system
};

[[nodiscard]] Error deviceError(DeviceFailure failure, std::string text);

/// Returns the error of kDeviceDomain for a system or database error during an attempt to get `access` to the device at
/// `path`. Returns errors of kDeviceDomain unchanged.
[[nodiscard]] Error deviceError(const std::string& path, Access access, const Error& cause);

}  // namespace appsync::device
