// How a process opens a device.
#pragma once

namespace appsync::device {

/// `exclusive`: the one process that may change the device. `readOnly`: any number, also beside it; nothing is written.
enum class Access { exclusive, readOnly };

}  // namespace appsync::device
