// Loads the plug-in.
#pragma once

#include <memory>
#include <stdexcept>
#include <string>

#include "platform/Platform.h"
#include "platform/ZTClient.h"

namespace port {

/// Loads the module at `path` and creates a client on `platform`, which must outlive the client. Never returns null.
/// Throws std::runtime_error, with a message for the user, if the file cannot be loaded, is not a plug-in, or has
/// another interface version than this daemon.
[[nodiscard]] std::shared_ptr<appsync::platform::ZTClient> loadPlugin(const std::string& path,
                                                                      appsync::platform::Platform& platform);

}  // namespace port
