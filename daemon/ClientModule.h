// Loading of the sync plug-in.
#pragma once

#include <memory>
#include <string>

#include "base/Error.h"
#include "platform/Platform.h"
#include "platform/ZTClient.h"

namespace appsync::daemon {

/// Returns the path of the plug-in's file: the value of the environment variable APPSYNC_MODULE or, if that is not set,
/// the file that is built and installed with this program. Fails if a relative path cannot be resolved.
[[nodiscard]] Result<std::string> modulePath();

/// Loads the plug-in and creates a client; the plug-in stays loaded. `platform` must outlive the client. Fails if the
/// file cannot be loaded or has another interface version, with a text that says what to do, and if the plug-in refuses
/// to create a client, with the plug-in's own text.
[[nodiscard]] Result<std::shared_ptr<platform::ZTClient>> makeClient(platform::Platform& platform);

/// As above, for the plug-in in the file at `path`.
[[nodiscard]] Result<std::shared_ptr<platform::ZTClient>> makeClient(platform::Platform& platform,
                                                                     const std::string& path);

}  // namespace appsync::daemon
