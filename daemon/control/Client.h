// The way from another process to a running sync.
#pragma once

#include <string>

#include "base/Error.h"
#include "daemon/control/Protocol.h"

namespace appsync::daemon {

/// Asks the sync that runs on a device, and waits for its answer, though not for long. Errors: "POSIX", with a sentence
/// that says what to do: no sync runs, it is another user's, or it does not answer.
[[nodiscard]] Result<ControlAnswer> askSync(const std::string& devicePath, const ControlRequest& request);

}  // namespace appsync::daemon
