// From the words of a command line to a command.
#pragma once

#include "cli/ExitStatus.h"

namespace appsync::cli {

/// Runs the command that these words ask for, or shows the help that they ask for. Wrong usage is explained on standard
/// error.
[[nodiscard]] ExitStatus runCommandLine(int count, const char* const* words);

}  // namespace appsync::cli
