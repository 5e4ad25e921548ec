// The command line.
#pragma once

#include "cli/ExitStatus.h"

namespace appsync::cli {

/// Parses the `count` words, of which the first is the program's name, and runs the command or shows the requested
/// help. Reports an invalid command line on standard error.
[[nodiscard]] ExitStatus runCommandLine(int count, const char* const* words);

}  // namespace appsync::cli
