// Files of this machine, outside any device.
#pragma once

#include <string>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::device {

/// Makes the file at a host path hold `bytes`, in one step: after a failure, a kill or a loss of power it holds what it
/// held, or all of `bytes`. Errors: "POSIX", the text names the path.
[[nodiscard]] Status replaceHostFile(const std::string& path, ByteView bytes);

}  // namespace appsync::device
