// Files of this machine, as commands read and write them.
#pragma once

#include <string>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::tools {

/// The name that stands for standard input, or standard output.
inline constexpr const char* kStandardStream = "-";

/// The whole of a file, a pipe or, for "-", of standard input. Errors: "POSIX", the text names the path.
[[nodiscard]] Result<Bytes> readHostFile(const std::string& path);

/// Replaces a file in one step; a pipe or device is written to as it is, "-" is standard output. After a failure a file
/// is as it was.
[[nodiscard]] Status writeHostFile(const std::string& path, ByteView bytes);

}  // namespace appsync::tools
