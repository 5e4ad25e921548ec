// Names that nothing else has.
#pragma once

#include <string>

namespace appsync::device {

/// A random UUID, version 4, in capitals. Threads: any.
[[nodiscard]] std::string newUUID();

}  // namespace appsync::device
