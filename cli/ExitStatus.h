// The exit status of the process.
#pragma once

namespace appsync::cli {

enum class ExitStatus : int {
  done = 0,
  someAppFailed = 1,  ///< the command completed, but failed for some app
  wrongUsage = 2,     ///< invalid command line
  unusable = 3,       ///< a device, library, file or plug-in cannot be used
};

}  // namespace appsync::cli
