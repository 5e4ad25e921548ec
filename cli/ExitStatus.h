// What the process tells its caller.
#pragma once

namespace appsync::cli {

enum class ExitStatus : int {
  done = 0,
  someAppFailed = 1,  ///< the command ran to its end, but not for every app
  wrongUsage = 2,     ///< the command line asks for what there is not
  unusable = 3,       ///< a device, library, file or plug-in cannot be used
};

}  // namespace appsync::cli
