// The sync plug-in, loaded as a daemon does it.
#pragma once

#include <memory>
#include <string>

#include "base/Error.h"
#include "platform/Platform.h"
#include "platform/ZTClient.h"

namespace appsync::daemon {

/// The plug-in's file: what the environment variable APPSYNC_MODULE names, or else the one that is built and installed
/// with this program. A name without a folder that it starts from is an error.
[[nodiscard]] Result<std::string> modulePath();

/// A client of the plug-in in that file, which stays loaded. `platform` must outlive the client. Of a file that cannot
/// be loaded or does not fit this program the error says what to do; why a module makes no client it says in the
/// module's own words.
[[nodiscard]] Result<std::shared_ptr<platform::ZTClient>> makeClient(platform::Platform& platform);

/// The same of the plug-in in the file at `path`.
[[nodiscard]] Result<std::shared_ptr<platform::ZTClient>> makeClient(platform::Platform& platform,
                                                                     const std::string& path);

}  // namespace appsync::daemon
