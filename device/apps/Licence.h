// What the device understands of an app's licence data.
#pragma once

#include "base/Bytes.h"

namespace appsync::device {

/// Whether the licence is for one device alone: a property-list dictionary with a string under "DeviceIdentifier". An
/// embedded device has no identifier of its own and takes whichever stands there for its own. All other bytes, and
/// none, are a licence for any device.
[[nodiscard]] bool isDeviceBound(ByteView licence);

}  // namespace appsync::device
