// Client end of a sync's control socket.
#pragma once

#include <string>

#include "base/Error.h"
#include "daemon/control/Protocol.h"

namespace appsync::daemon {

/// Sends a request to the sync that is running on a device and waits for its answer, with a time-out. Errors: "POSIX",
/// with a text that says what to do: no sync is running, it belongs to another user, or it does not answer.
[[nodiscard]] Result<ControlAnswer> askSync(const std::string& devicePath, const ControlRequest& request);

}  // namespace appsync::daemon
