// Access modes of a device.
#pragma once

namespace appsync::device {

/// `exclusive`: one process, which may change the device. `readOnly`: any number of processes, also while another has
/// exclusive access; they write nothing.
enum class Access { exclusive, readOnly };

}  // namespace appsync::device
