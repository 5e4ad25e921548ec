// Why a device cannot be made or opened.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/storage/Access.h"

namespace appsync::device {

/// Error domain of `Device::create` and `Device::open`.
inline constexpr std::string_view kDeviceDomain = "Device";

/// The codes of errors in kDeviceDomain. Each text says what is wrong and what to do.
enum class DeviceFailure : long {
  missing = 1,    ///< there is no such folder
  notADevice,     ///< a folder or file that is something else
  exists,         ///< `create` where a device, or something else, is already
  damaged,        ///< the database, or part of the folder, cannot be read
  otherVersion,   ///< made by another version of this program
  noSpace,        ///< the disk is full
  readOnly,       ///< the folder or its file system may not be written
  held,           ///< another process holds the device
  notAccessible,  ///< the system refuses it for another reason
};

[[nodiscard]] Error deviceError(DeviceFailure failure, std::string text);

/// What a failure of the system or of the database means for somebody who wants `access` to the device at `path`.
[[nodiscard]] Error deviceError(const std::string& path, Access access, const Error& cause);

}  // namespace appsync::device
